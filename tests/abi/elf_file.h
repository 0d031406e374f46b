// What the dynamic linker sees of a 64-bit ELF shared object of this machine, read from the file.
#pragma once

#include <elf.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace ovtest
{

struct DynamicSymbol {
    std::string name;
    std::string version; // empty when it has none
    std::string library; // where an undefined symbol's version is expected
    bool defined = false;
    bool weak = false;
    unsigned char type = STT_NOTYPE;
    Elf64_Xword size = 0;
};

class ElfFile
{
  public:
    // Throws std::runtime_error when the file is not such an object.
    explicit ElfFile(const std::string &path);

    // All global and weak symbols; not the names of versions, which are symbols too.
    std::vector<DynamicSymbol> symbols() const;

    // Texts of all entries of the dynamic section with this tag.
    std::vector<std::string> dynamic_texts(Elf64_Sxword tag) const;

    // The number of a dynamic entry; 0 when there is none.
    Elf64_Xword dynamic_number(Elf64_Sxword tag) const;
    bool has_dynamic(Elf64_Sxword tag) const;

    std::vector<Elf64_Phdr> segments() const;

  private:
    struct Version {
        std::string name;
        std::string library;
    };

    template <typename T>
    T at(std::size_t offset) const;
    template <typename T>
    std::vector<T> table(std::size_t offset, std::size_t count) const;
    std::string text(const Elf64_Shdr &strings, std::size_t offset) const;
    // Null when the file has no such section.
    const Elf64_Shdr *section(Elf64_Word type) const;
    const Elf64_Shdr &strings_of(const Elf64_Shdr &section) const;
    std::vector<Elf64_Dyn> dynamic() const;
    // By version index.
    std::vector<Version> versions() const;
    void add_defined_versions(std::vector<Version> &versions) const;
    void add_needed_versions(std::vector<Version> &versions) const;

    std::string bytes_;
    Elf64_Ehdr header_ = {};
    std::vector<Elf64_Shdr> sections_;
};

} // namespace ovtest
