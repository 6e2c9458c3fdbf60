#include "tools/shared/Output.h"

#include "tools/shared/Trouble.h"
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <unistd.h>

namespace tools
{
namespace
{
constexpr std::size_t Piece = 1 << 16;

// The ways in which people turn colours off: no-color.org, and a terminal that has none.
bool WantsColours(std::FILE* file)
{
    char const* const noColour = std::getenv("NO_COLOR");
    char const* const terminal = std::getenv("TERM");
    return isatty(fileno(file)) && !(noColour && *noColour) && terminal && std::strcmp(terminal, "dumb") != 0;
}

char const* CodeOf(Colour colour)
{
    switch (colour)
    {
    case Colour::Quiet:
        return "\x1B[2m";
    case Colour::Item:
        return "\x1B[36m";
    case Colour::Added:
        return "\x1B[32m";
    default:
        return "\x1B[31m";
    }
}

[[noreturn]] void TellFailure()
{
    if (errno == EPIPE)
        throw ClosedPipe();
    throw Trouble(std::string("the output cannot be written: ") + std::strerror(errno) +
                  "; make room there, or send it elsewhere");
}
}  // namespace

Output::Output(std::FILE* file) : m_file(file), m_hasColours(WantsColours(file)) {}

void Output::Add(std::string_view text)
{
    m_text += text;
    if (!m_file || m_text.size() < Piece)
        return;
    if (std::fwrite(m_text.data(), 1, m_text.size(), m_file) != m_text.size())
        TellFailure();
    m_text.clear();
}

void Output::Flush()
{
    if (!m_file)
        return;
    bool const isWritten = std::fwrite(m_text.data(), 1, m_text.size(), m_file) == m_text.size();
    m_text.clear();
    if (!isWritten || std::fflush(m_file) != 0)
        TellFailure();
}

std::string Output::Painted(Colour colour, std::string_view text) const
{
    return m_hasColours ? CodeOf(colour) + std::string(text) + "\x1B[0m" : std::string(text);
}
}  // namespace tools
