#include "standin/server/files/Report.h"

#include "standin/server/files/RefusableCall.h"
#include <algorithm>
#include <cstdio>
#include <new>

namespace standin
{
namespace
{
void Print(std::string_view text) noexcept { std::fwrite(text.data(), 1, text.size(), stderr); }
}  // namespace

void Report(std::string const& line) noexcept
{
    std::fprintf(stderr, "%s\n", line.c_str());
    RefusableCall::Note({line});
}

void Report(std::initializer_list<std::string_view> parts, std::string_view program) noexcept
{
    try
    {
        Print(Joined({program, Joined(parts), "\n"}));  // at once: others print, too
    }
    catch (std::bad_alloc const&)
    {
        Print(program);
        for (std::string_view const part : parts)
            Print(part);
        Print("\n");
    }
    RefusableCall::Note(parts);
}

std::string Joined(std::initializer_list<std::string_view> parts)
{
    std::string joined;
    for (std::string_view const part : parts)
        joined += part;
    return joined;
}

std::string ForMessages(std::string_view text)
{
    std::string shown(text);
    std::replace_if(
        shown.begin(), shown.end(), [](unsigned char byte) { return byte < 0x20 || byte == 0x7F; }, '?');
    return shown;
}
}  // namespace standin
