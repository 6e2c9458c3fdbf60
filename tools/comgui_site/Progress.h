// How far long work is, on a terminal: a line on stderr that is written over, and gone at the end. It appears
// only when the work takes longer than people notice. Elsewhere nothing is shown.
#pragma once

#include <chrono>
#include <string>

namespace comgui_site
{
class Progress
{
public:
    explicit Progress(std::string what);  // "checking the tickets"
    ~Progress();
    Progress(Progress const&) = delete;
    Progress& operator=(Progress const&) = delete;

    // Throws Interrupted as soon as somebody wants the program to end. total 0: not known.
    void operator()(unsigned long long done, unsigned long long total);

private:
    using Clock = std::chrono::steady_clock;

    std::string const m_what;
    bool const m_isShown;
    Clock::time_point m_next;
    std::size_t m_width = 0;  // of the line that is there
};
}  // namespace comgui_site
