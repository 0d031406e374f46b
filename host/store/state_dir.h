#pragma once
// The directory that holds a daemon's durable state. One process at a time has it: a file lock
// that ends with the process, however it ends. Neighbour: store.h keeps its database in it.

#include "host/support/unique_fd.h"

#include <filesystem>

namespace ovhost
{

class StateDir
{
  public:
    /// Makes the directory when it is missing and takes the lock. A directory that holds nothing
    /// else is closed to other users (mode 0700); one that holds other files too keeps its mode,
    /// and is refused when other users can write it. Throws StoreError, which names the process
    /// that has the lock when it is known.
    explicit StateDir(std::filesystem::path dir);

    [[nodiscard]] const std::filesystem::path &path() const noexcept { return path_; }

  private:
    std::filesystem::path path_;
    UniqueFd lock_;
};

} // namespace ovhost
