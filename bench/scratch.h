#pragma once
// A temporary folder that goes with its owner.

#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>

namespace ovbench
{

class ScratchDir
{
  public:
    ScratchDir()
    {
        std::string path = (std::filesystem::temp_directory_path() / "ovbench.XXXXXX").string();
        if (::mkdtemp(path.data()) == nullptr) {
            throw std::runtime_error("cannot make a temporary folder");
        }
        path_ = path;
    }
    ~ScratchDir()
    {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    ScratchDir(const ScratchDir &) = delete;
    ScratchDir &operator=(const ScratchDir &) = delete;

    [[nodiscard]] const std::filesystem::path &path() const { return path_; }

  private:
    std::filesystem::path path_;
};

} // namespace ovbench
