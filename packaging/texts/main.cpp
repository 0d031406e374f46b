// ovctl_texts: writes the texts that are made from ovctl's command table, at build time.
//   ovctl_texts bash OUTPUT
//   ovctl_texts zsh OUTPUT
//   ovctl_texts manual OUTPUT TEMPLATE

#include "packaging/texts/completion.h"
#include "packaging/texts/manual.h"

#include <fstream>
#include <iostream>
#include <string>
#include <vector>

namespace
{

bool print(const std::vector<std::string> &words, std::ostream &out)
{
    if (words[0] == "bash" || words[0] == "zsh") {
        (words[0] == "bash" ? ovhost::print_bash_completion : ovhost::print_zsh_completion)(out);
        return true;
    }
    if (words[0] != "manual" || words.size() != 3)
        return false;
    std::ifstream page(words[2]);
    return page && ovhost::print_manual(page, out);
}

} // namespace

int main(int argc, char **argv)
{
    const std::vector<std::string> words(argv + 1, argv + argc);
    std::ofstream out(words.size() > 1 ? words[1] : "");
    if (words.size() > 1 && print(words, out) && out.flush())
        return 0;
    std::cerr << "ovctl_texts: cannot write " << (words.size() > 1 ? words[1] : "the output")
              << '\n';
    return 1;
}
