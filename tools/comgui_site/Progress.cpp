#include "tools/comgui_site/Progress.h"

#include "tools/comgui_site/Interrupts.h"
#include <cstdio>
#include <unistd.h>
#include <utility>

namespace comgui_site
{
using namespace std::chrono_literals;

Progress::Progress(std::string what)
    : m_what(std::move(what)), m_isShown(isatty(STDERR_FILENO) == 1), m_next(Clock::now() + 300ms)
{
}

Progress::~Progress()
{
    if (m_width > 0)
        std::fprintf(stderr, "\r%*s\r", static_cast<int>(m_width), "");
}

void Progress::operator()(unsigned long long done, unsigned long long total)
{
    Interrupts::Check();
    if (!m_isShown || Clock::now() < m_next)
        return;
    m_next = Clock::now() + 100ms;
    auto const percent = 100 * static_cast<double>(done) / static_cast<double>(total == 0 ? 1 : total);
    std::string line = m_what + " ... " + std::to_string(done);
    if (total > 0)
        line = m_what + " ... " + std::to_string(static_cast<int>(percent)) + " %";
    std::size_t const width = line.size();
    line.resize(width < m_width ? m_width : width, ' ');
    m_width = width;
    std::fprintf(stderr, "\r%s", line.c_str());
    std::fflush(stderr);
}
}  // namespace comgui_site
