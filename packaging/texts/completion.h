#pragma once
// The shell completions of ovctl, made from its command table: command_words.h.

#include <iosfwd>

namespace ovhost
{

void print_bash_completion(std::ostream &out);
void print_zsh_completion(std::ostream &out);

} // namespace ovhost
