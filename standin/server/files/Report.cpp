#include "standin/server/files/Report.h"

#include <algorithm>
#include <cstdio>

namespace standin
{
void Report(std::string const& line) noexcept { std::fprintf(stderr, "%s\n", line.c_str()); }

std::string ForMessages(std::string_view text)
{
    std::string shown(text);
    std::replace_if(
        shown.begin(), shown.end(), [](unsigned char byte) { return byte < 0x20 || byte == 0x7F; }, '?');
    return shown;
}
}  // namespace standin
