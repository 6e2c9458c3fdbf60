#include "desk/view/Theme.h"

#include <algorithm>
#include <wx/settings.h>

namespace desk
{
namespace
{
struct Pair
{
    wxColour light;
    wxColour dark;
};

Pair ColoursOf(Accent accent)
{
    switch (accent)
    {
    case Accent::Changed:
        return {{255, 236, 150}, {110, 88, 10}};
    case Accent::Difference:
        return {{255, 224, 204}, {104, 58, 30}};
    case Accent::Good:
        return {{16, 112, 48}, {120, 214, 140}};
    default:
        return {{176, 24, 24}, {255, 140, 130}};
    }
}

unsigned char Between(unsigned char from, unsigned char to, double share)
{
    return static_cast<unsigned char>(from + share * (to - from));
}
}  // namespace

bool IsDark() { return wxSystemSettings::GetAppearance().IsUsingDarkBackground(); }

wxColour ColourOf(Accent accent, double strength)
{
    auto const [light, dark] = ColoursOf(accent);
    wxColour const full = IsDark() ? dark : light;
    wxColour const back = wxSystemSettings::GetColour(wxSYS_COLOUR_LISTBOX);
    double const share = std::clamp(strength, 0.0, 1.0);
    return {Between(back.Red(), full.Red(), share), Between(back.Green(), full.Green(), share),
            Between(back.Blue(), full.Blue(), share)};
}
}  // namespace desk
