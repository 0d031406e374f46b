#include "tests/abi/elf_file.h"

#include <algorithm>
#include <cstring>
#include <fstream>
#include <iterator>
#include <stdexcept>

namespace ovtest
{

namespace
{

constexpr Elf64_Half version_index_mask = 0x7fff;

} // namespace

ElfFile::ElfFile(const std::string &path)
{
    std::ifstream file(path, std::ios::binary);
    bytes_.assign(std::istreambuf_iterator<char>(file), {});
    if (!bytes_.starts_with(ELFMAG)) {
        throw std::runtime_error(path + " is no ELF file");
    }
    header_ = at<Elf64_Ehdr>(0);
    if (header_.e_ident[EI_CLASS] != ELFCLASS64 || header_.e_type != ET_DYN) {
        throw std::runtime_error(path + " is no 64-bit shared object");
    }
    sections_ = table<Elf64_Shdr>(header_.e_shoff, header_.e_shnum);
    if (section(SHT_DYNAMIC) == nullptr || section(SHT_DYNSYM) == nullptr) {
        throw std::runtime_error(path + " has no dynamic symbols");
    }
}

template <typename T>
T ElfFile::at(std::size_t offset) const
{
    if (offset > bytes_.size() || bytes_.size() - offset < sizeof(T)) {
        throw std::runtime_error("the ELF file is cut short");
    }
    T object;
    std::memcpy(&object, bytes_.data() + offset, sizeof object);
    return object;
}

template <typename T>
std::vector<T> ElfFile::table(std::size_t offset, std::size_t count) const
{
    std::vector<T> rows;
    for (std::size_t i = 0; i < count; ++i) {
        rows.push_back(at<T>(offset + i * sizeof(T)));
    }
    return rows;
}

std::string ElfFile::text(const Elf64_Shdr &strings, std::size_t offset) const
{
    const std::string_view all =
        std::string_view(bytes_).substr(strings.sh_offset, strings.sh_size);
    const std::string_view from = all.substr(offset);
    return std::string(from.substr(0, from.find('\0')));
}

const Elf64_Shdr *ElfFile::section(Elf64_Word type) const
{
    const auto found = std::ranges::find(sections_, type, &Elf64_Shdr::sh_type);
    return found != sections_.end() ? &*found : nullptr;
}

const Elf64_Shdr &ElfFile::strings_of(const Elf64_Shdr &section) const
{
    return sections_.at(section.sh_link);
}

std::vector<Elf64_Dyn> ElfFile::dynamic() const
{
    const Elf64_Shdr &section = *this->section(SHT_DYNAMIC);
    return table<Elf64_Dyn>(section.sh_offset, section.sh_size / sizeof(Elf64_Dyn));
}

std::vector<std::string> ElfFile::dynamic_texts(Elf64_Sxword tag) const
{
    std::vector<std::string> texts;
    for (const Elf64_Dyn &entry : dynamic()) {
        if (entry.d_tag == tag) {
            texts.push_back(text(strings_of(*section(SHT_DYNAMIC)), entry.d_un.d_val));
        }
    }
    return texts;
}

Elf64_Xword ElfFile::dynamic_number(Elf64_Sxword tag) const
{
    const std::vector<Elf64_Dyn> entries = dynamic();
    const auto found = std::ranges::find(entries, tag, &Elf64_Dyn::d_tag);
    return found != entries.end() ? found->d_un.d_val : 0;
}

bool ElfFile::has_dynamic(Elf64_Sxword tag) const
{
    return std::ranges::count(dynamic(), tag, &Elf64_Dyn::d_tag) != 0;
}

std::vector<Elf64_Phdr> ElfFile::segments() const
{
    return table<Elf64_Phdr>(header_.e_phoff, header_.e_phnum);
}

void ElfFile::add_defined_versions(std::vector<Version> &versions) const
{
    const Elf64_Shdr *const section = this->section(SHT_GNU_verdef);
    std::size_t offset = section != nullptr ? section->sh_offset : 0;
    for (std::size_t i = 0; section != nullptr && i < section->sh_info; ++i) {
        const auto definition = at<Elf64_Verdef>(offset);
        const auto name = at<Elf64_Verdaux>(offset + definition.vd_aux);
        versions.resize(std::max<std::size_t>(versions.size(), definition.vd_ndx + 1U));
        // The first definition is the file's own name, and no version of a symbol.
        if ((definition.vd_flags & VER_FLG_BASE) == 0) {
            versions[definition.vd_ndx].name = text(strings_of(*section), name.vda_name);
        }
        offset += definition.vd_next;
    }
}

void ElfFile::add_needed_versions(std::vector<Version> &versions) const
{
    const Elf64_Shdr *const section = this->section(SHT_GNU_verneed);
    std::size_t offset = section != nullptr ? section->sh_offset : 0;
    for (std::size_t i = 0; section != nullptr && i < section->sh_info; ++i) {
        const auto need = at<Elf64_Verneed>(offset);
        std::size_t name_offset = offset + need.vn_aux;
        for (unsigned j = 0; j < need.vn_cnt; ++j) {
            const auto name = at<Elf64_Vernaux>(name_offset);
            versions.resize(std::max<std::size_t>(versions.size(), name.vna_other + 1U));
            versions[name.vna_other] = {text(strings_of(*section), name.vna_name),
                                        text(strings_of(*section), need.vn_file)};
            name_offset += name.vna_next;
        }
        offset += need.vn_next;
    }
}

std::vector<ElfFile::Version> ElfFile::versions() const
{
    std::vector<Version> all(2); // 0 and 1 stand for no version
    add_defined_versions(all);
    add_needed_versions(all);
    return all;
}

std::vector<DynamicSymbol> ElfFile::symbols() const
{
    const Elf64_Shdr &section = *this->section(SHT_DYNSYM);
    const std::size_t count = section.sh_size / sizeof(Elf64_Sym);
    const auto rows = table<Elf64_Sym>(section.sh_offset, count);
    const Elf64_Shdr *const version_section = this->section(SHT_GNU_versym);
    const auto version_indices = version_section != nullptr
                                     ? table<Elf64_Half>(version_section->sh_offset, count)
                                     : std::vector<Elf64_Half>(count, VER_NDX_GLOBAL);
    const std::vector<Version> versions = this->versions();

    std::vector<DynamicSymbol> symbols;
    for (std::size_t i = 1; i < count; ++i) { // the first row is none
        const Elf64_Sym &row = rows[i];
        if (ELF64_ST_BIND(row.st_info) == STB_LOCAL || row.st_shndx == SHN_ABS) {
            continue;
        }
        const Version &version = versions.at(version_indices[i] & version_index_mask);
        symbols.push_back({text(strings_of(section), row.st_name), version.name, version.library,
                           row.st_shndx != SHN_UNDEF, ELF64_ST_BIND(row.st_info) == STB_WEAK,
                           static_cast<unsigned char>(ELF64_ST_TYPE(row.st_info)), row.st_size});
    }
    return symbols;
}

} // namespace ovtest
