// The library as a file: what it exports, what it needs, and how it is protected once loaded.
#include "tests/abi/elf_file.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <iterator>
#include <set>
#include <stdexcept>

using ovtest::DynamicSymbol;
using ovtest::ElfFile;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{

using Names = std::set<std::string>;

Names names_in(const std::string &path)
{
    std::ifstream file(path);
    Names names{std::istream_iterator<std::string>(file), {}};
    if (names.empty()) {
        throw std::runtime_error(path + " holds no names");
    }
    return names;
}

// The compiler's start files ask for these and do without them.
const Names optional_hooks = {"__gmon_start__", "_ITM_deregisterTMCloneTable",
                              "_ITM_registerTMCloneTable"};

class LibraryFile : public testing::Test
{
  protected:
    const ElfFile elf_{OVTEST_LIBRARY};
};

TEST_F(LibraryFile, ExportsTheListedSymbolsAndNoOthers)
{
    Names exported;
    for (const DynamicSymbol &symbol : elf_.symbols()) {
        if (symbol.defined) {
            exported.insert(symbol.name);
        }
    }
    EXPECT_EQ(exported, names_in(OVTEST_EXPORTED_SYMBOLS));
}

TEST_F(LibraryFile, ExportsFunctionsAndTheTwoTables)
{
    constexpr Elf64_Xword table_size = 65536 * 32;
    Names tables;
    for (const DynamicSymbol &symbol : elf_.symbols()) {
        if (symbol.defined && symbol.type == STT_OBJECT) {
            tables.insert(symbol.name);
            EXPECT_EQ(symbol.size, table_size) << symbol.name;
        } else if (symbol.defined) {
            EXPECT_EQ(symbol.type, STT_FUNC) << symbol.name;
        }
    }
    EXPECT_THAT(tables, ElementsAre("tunalias_assoc", "tunname_assoc"));
}

TEST_F(LibraryFile, ExportsThemInOneVersion)
{
    for (const DynamicSymbol &symbol : elf_.symbols()) {
        if (symbol.defined) {
            EXPECT_EQ(symbol.version, "OVMD_1") << symbol.name;
        }
    }
}

TEST_F(LibraryFile, HasItsName)
{
    EXPECT_THAT(elf_.dynamic_texts(DT_SONAME), ElementsAre("libovmd.so.1"));
}

TEST_F(LibraryFile, NeedsTheCLibraryAlone)
{
    EXPECT_THAT(elf_.dynamic_texts(DT_NEEDED), ElementsAre("libc.so.6"));
}

TEST_F(LibraryFile, IsFoundAndFindsOthersInTheUsualPlacesOnly)
{
    EXPECT_THAT(elf_.dynamic_texts(DT_RPATH), IsEmpty());
    EXPECT_THAT(elf_.dynamic_texts(DT_RUNPATH), IsEmpty());
}

TEST_F(LibraryFile, LeavesToOthersWhatTheCLibraryOrTheHostProvides)
{
    const Names host_operations = names_in(OVTEST_HOST_OPERATIONS_FILE);
    unsigned of_host = 0;
    unsigned of_c_library = 0;
    for (const DynamicSymbol &symbol : elf_.symbols()) {
        if (symbol.defined) {
            continue;
        }
        if (symbol.version.starts_with("GLIBC_") && symbol.library == "libc.so.6") {
            ++of_c_library;
        } else if (host_operations.contains(symbol.name)) {
            EXPECT_EQ(symbol.version, "") << symbol.name;
            EXPECT_FALSE(symbol.weak) << symbol.name << " would be missed only when it is called";
            ++of_host;
        } else {
            EXPECT_TRUE(symbol.weak && optional_hooks.contains(symbol.name))
                << symbol.name << ' ' << symbol.version;
        }
    }
    EXPECT_GT(of_host, 0U);
    EXPECT_GT(of_c_library, 0U);
}

TEST_F(LibraryFile, IsResolvedWhenItIsLoaded)
{
    EXPECT_TRUE((elf_.dynamic_number(DT_FLAGS) & DF_BIND_NOW) != 0 ||
                (elf_.dynamic_number(DT_FLAGS_1) & DF_1_NOW) != 0);
}

TEST_F(LibraryFile, ProtectsItsTablesOnceTheyAreResolved)
{
    const auto segments = elf_.segments();
    EXPECT_EQ(std::ranges::count(segments, Elf64_Word{PT_GNU_RELRO}, &Elf64_Phdr::p_type), 1);
}

TEST_F(LibraryFile, HasNoCodeThatCanBeWritten)
{
    bool says_stack = false;
    for (const Elf64_Phdr &segment : elf_.segments()) {
        if (segment.p_type == PT_GNU_STACK) {
            says_stack = true;
            EXPECT_EQ(segment.p_flags & PF_X, 0U) << "the stack can be executed";
        }
        if (segment.p_type == PT_LOAD) {
            EXPECT_NE(segment.p_flags & (PF_W | PF_X), Elf64_Word{PF_W | PF_X});
        }
    }
    EXPECT_TRUE(says_stack) << "without a word about it the stack can be executed";
}

TEST_F(LibraryFile, IsSharedByAllProcesses)
{
    EXPECT_FALSE(elf_.has_dynamic(DT_TEXTREL));
    EXPECT_EQ(elf_.dynamic_number(DT_FLAGS) & DF_TEXTREL, 0U);
}

} // namespace
