#pragma once
// A folder of its own for one test, removed at the end, and what tests do with files in it.

#include <string>

namespace ovhost::test
{

class TempDir
{
  public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir &) = delete;
    TempDir &operator=(const TempDir &) = delete;

    [[nodiscard]] std::string path(const std::string &name) const { return path_ + "/" + name; }

  private:
    std::string path_;
};

[[nodiscard]] std::string read_file(const std::string &path);
void write_file(const std::string &path, const std::string &text);

} // namespace ovhost::test
