#include "host/mgmtd/private_root.h"

#include "host/support/unique_fd.h"

#include <fcntl.h>
#include <linux/capability.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <stdexcept>
#include <string>
#include <system_error>
#include <vector>

namespace ovhost
{
namespace
{

namespace fs = std::filesystem;

struct FixedPath {
    const char *path;
    std::vector<std::string> below; // directories the library expects in it
};

const std::array<FixedPath, 2> &fixed_paths()
{
    static const std::array<FixedPath, 2> paths{{
        {"/opt/orvale", {}},
        {"/var/opt/tms", {"output"}},
    }};
    return paths;
}

constexpr const char *kAllowNamespaces =
    "run as root, or allow user namespaces (sysctl kernel.unprivileged_userns_clone=1,"
    " user.max_user_namespaces above 0; a container must allow unshare and mount)";

[[noreturn]] void fail(const std::string &doing, int cause, const std::string &advice = {})
{
    throw std::runtime_error("cannot enter a private root: " + doing +
                             " failed: " + std::generic_category().message(cause) +
                             (advice.empty() ? "" : "; " + advice));
}

// Names an open file for calls that take a path, wherever it is and whatever covers it.
std::string path_of(const UniqueFd &file)
{
    return "/proc/self/fd/" + std::to_string(file.get());
}

using Capabilities = std::array<__user_cap_data_struct, _LINUX_CAPABILITY_U32S_3>;

Capabilities capabilities()
{
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    Capabilities sets{};
    if (::syscall(SYS_capget, &header, sets.data()) != 0) {
        fail("reading capabilities", errno);
    }
    return sets;
}

// A new user namespace comes with every capability in it, which would let the process pass the
// permissions of its own files.
void restore_capabilities(const Capabilities &sets)
{
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    if (::syscall(SYS_capset, &header, sets.data()) != 0) {
        fail("dropping capabilities", errno);
    }
}

void write_process_file(const std::string &name, const std::string &text)
{
    const std::string file = "/proc/self/" + name;
    const UniqueFd opened(::open(file.c_str(), O_WRONLY | O_CLOEXEC));
    const auto size = static_cast<ssize_t>(text.size());
    if (!opened || ::write(opened.get(), text.data(), text.size()) != size) {
        fail("writing " + file, errno, kAllowNamespaces);
    }
}

std::string map_to_itself(id_t id)
{
    return std::to_string(id) + " " + std::to_string(id) + " 1";
}

void unshare_as_user()
{
    const uid_t user = ::geteuid();
    const gid_t group = ::getegid();
    if (::unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0) {
        const int cause = errno;
        fail("making a user and mount namespace", cause,
             cause == EINVAL ? "the process must have one thread" : kAllowNamespaces);
    }
    write_process_file("setgroups", "deny");
    write_process_file("uid_map", map_to_itself(user));
    write_process_file("gid_map", map_to_itself(group));
}

void unshare_mounts()
{
    // What root may do, a container may forbid; a user namespace may still be allowed there.
    if (::unshare(CLONE_NEWNS) != 0) {
        unshare_as_user();
    }
    // Else the mounts would spread to the machine.
    if (::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0) {
        fail("making the mounts private", errno, kAllowNamespaces);
    }
}

UniqueFd open_directory(int parent, const std::string &name)
{
    return UniqueFd(::openat(parent, name.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
}

// Follows no link: one that leads out of the root would have directories made on the machine.
UniqueFd make_directory(const UniqueFd &parent, const std::string &name, const fs::path &full)
{
    UniqueFd opened = open_directory(parent.get(), name);
    if (!opened && errno == ENOENT) {
        if (::mkdirat(parent.get(), name.c_str(), 0755) != 0) {
            fail("making " + full.string(), errno, "give this user write permission");
        }
        opened = open_directory(parent.get(), name);
    }
    if (!opened) {
        fail("opening " + full.string(), errno, "it must be a directory and no link");
    }
    return opened;
}

UniqueFd make_directories(const UniqueFd &root, const fs::path &dir, const FixedPath &fixed)
{
    UniqueFd at(::dup(root.get()));
    fs::path full = dir;
    for (const fs::path &name : fs::path(fixed.path).relative_path()) {
        full /= name;
        at = make_directory(at, name.string(), full);
    }
    for (const std::string &name : fixed.below) {
        make_directory(at, name, full / name);
    }
    return at;
}

// The directories of the fixed paths, in their order.
std::vector<UniqueFd> open_sources(const fs::path &dir)
{
    const UniqueFd root(::open(dir.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
    if (!root) {
        fail("opening " + dir.string(), errno, "make the directory first");
    }
    std::vector<UniqueFd> sources;
    for (const FixedPath &fixed : fixed_paths()) {
        sources.push_back(make_directories(root, dir, fixed));
    }
    return sources;
}

void bind(const std::string &source, const std::string &target)
{
    // Recursive: the kernel does not let a user namespace uncover what lies beneath a mount.
    if (::mount(source.c_str(), target.c_str(), nullptr, MS_BIND | MS_REC, nullptr) != 0) {
        fail("mounting on " + target, errno);
    }
}

// Makes an entry of a covered directory visible again in the empty directory that covers it.
void show_entry(const fs::directory_entry &entry, const fs::path &covering)
{
    const std::string target = (covering / entry.path().filename()).string();
    if (entry.is_symlink()) {
        fs::create_symlink(fs::read_symlink(entry.path()), target);
        return;
    }
    if (entry.is_directory()) {
        fs::create_directory(target);
    } else {
        const UniqueFd made(::open(target.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
        if (!made) {
            fail("making " + target, errno);
        }
    }
    bind(entry.path().string(), target);
}

// Nothing can be made on the machine, so a directory in memory takes the parent's place, with
// the parent's entries and the new one.
void add_mount_point(const fs::path &point)
{
    const fs::path parent = point.parent_path();
    const UniqueFd covered(::open(parent.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!covered) {
        fail("opening " + parent.string(), errno, "make the directory " + parent.string());
    }
    if (::mount("tmpfs", parent.c_str(), "tmpfs", MS_NOSUID | MS_NODEV, "mode=0755") != 0) {
        fail("mounting on " + parent.string(), errno,
             "make the directory " + point.string() + " as root");
    }
    for (const fs::directory_entry &entry : fs::directory_iterator(path_of(covered))) {
        // It may be there after all, as a link that leads nowhere or as a file.
        if (entry.path().filename() != point.filename()) {
            show_entry(entry, parent);
        }
    }
    fs::create_directory(point);
}

// What other programs would write beside the mount point would be lost with the process.
void make_read_only(const fs::path &dir)
{
    const unsigned long flags = MS_REMOUNT | MS_BIND | MS_RDONLY | MS_NOSUID | MS_NODEV;
    if (::mount(nullptr, dir.c_str(), nullptr, flags, nullptr) != 0) {
        fail("making " + dir.string() + " read-only", errno);
    }
}

void cover(const fs::path &point, const UniqueFd &source)
{
    std::error_code ignored;
    const bool present = fs::is_directory(point, ignored);
    if (!present) {
        add_mount_point(point);
    }
    bind(path_of(source), point.string());
    if (!present) {
        make_read_only(point.parent_path());
    }
}

} // namespace

void enter_private_root(const fs::path &dir)
{
    const Capabilities before = capabilities();
    // With the permissions of now, not with those a namespace brings.
    open_sources(dir);
    unshare_mounts();
    // Opened again, since mounts of another namespace cannot be bound; and all before the first
    // mount, which may hide the directory.
    const std::vector<UniqueFd> sources = open_sources(dir);
    for (std::size_t i = 0; i < sources.size(); ++i) {
        cover(fixed_paths()[i].path, sources[i]);
    }
    restore_capabilities(before);
}

} // namespace ovhost
