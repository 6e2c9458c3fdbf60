#include "desk/view/ChartPalette.h"

#include <wx/settings.h>

namespace desk
{
namespace
{
constexpr double OfText = 4.5;
constexpr double OfShapes = 3;
constexpr Rgb Second{214, 112, 24};  // beside most themes' blue

Rgb SystemColour(wxSystemColour which)
{
    wxColour const colour = wxSystemSettings::GetColour(which);
    return {colour.Red(), colour.Green(), colour.Blue()};
}
}  // namespace

ChartPalette ChartPalette::Of(Rgb back, Rgb text, Rgb highlight)
{
    Rgb const readable = Readable(text, back, OfText);
    // The lines' names are written in the lines' colours.
    return {.back = back,
            .text = readable,
            .grid = Mixed(back, readable, 0.2),
            .empty = Mixed(back, readable, 0.08),
            .focus = Readable(highlight, back, OfShapes),
            .lines = {Readable(highlight, back, OfText), Readable(Second, back, OfText)}};
}

ChartPalette ChartPalette::OfSystem()
{
    return Of(SystemColour(wxSYS_COLOUR_WINDOW), SystemColour(wxSYS_COLOUR_WINDOWTEXT),
              SystemColour(wxSYS_COLOUR_HIGHLIGHT));
}
}  // namespace desk
