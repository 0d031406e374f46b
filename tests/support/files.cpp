#include "tests/support/files.h"

#include <fstream>
#include <iterator>
#include <stdexcept>

namespace ovtest
{

void write_file(const std::filesystem::path &file, const std::string &text)
{
    if (file.has_parent_path()) {
        std::filesystem::create_directories(file.parent_path());
    }
    std::ofstream stream(file, std::ios::binary | std::ios::trunc);
    stream << text;
    if (!stream.flush()) {
        throw std::runtime_error("cannot write " + file.string());
    }
}

std::optional<std::string> read_file(const std::filesystem::path &file)
{
    std::ifstream stream(file, std::ios::binary);
    if (!stream) {
        return std::nullopt;
    }
    return std::string(std::istreambuf_iterator<char>(stream), {});
}

} // namespace ovtest
