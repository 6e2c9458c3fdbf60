// What a command prints: to a file in large pieces, with colours if that is a terminal, or into a text.
#pragma once

#include <cstdio>
#include <string>
#include <string_view>

namespace tools
{
enum class Colour
{
    Quiet,
    Item,
    Bad,
    Removed,
    Added,
};

class Output
{
public:
    Output() = default;                // into Text(), without colours
    explicit Output(std::FILE* file);  // which is not closed

    // Throws Trouble if the file takes no more, ClosedPipe if it is a pipe that nobody reads.
    void Add(std::string_view text);
    void Flush();  // also at the end, since what is left is lost otherwise

    std::string Painted(Colour colour, std::string_view text) const;

    std::string const& Text() const { return m_text; }

private:
    std::FILE* m_file = nullptr;
    bool m_hasColours = false;
    std::string m_text;
};
}  // namespace tools
