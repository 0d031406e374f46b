#pragma once
// The three descriptors that every program takes for granted.

namespace ovhost
{

/// Which of the descriptors 0, 1 and 2 were open when the program began.
struct StandardFds {
    bool input = true;
    bool output = true;
    bool error = true;
};

/// Opens /dev/null on each of them that is closed: otherwise the next file or socket that the
/// program opens gets its number, and what is meant for the terminal goes there. To be called
/// before anything else is opened.
StandardFds fill_standard_fds() noexcept;

} // namespace ovhost
