#include "comgui/module/Called.h"

#include <cstdio>

namespace comgui::plugin
{
void Called::OnException(char const* reason) noexcept
{
    std::fprintf(stderr, "communication plug-in: a call failed%s%s\n", *reason ? ": " : "", reason);
}
}  // namespace comgui::plugin
