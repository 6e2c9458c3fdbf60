// The colours of a drawing, all readable on its background.
#pragma once

#include "desk/model/Contrast.h"
#include <array>

namespace desk
{
struct ChartPalette
{
    // highlight: the theme's colour for what is chosen; the lines are made of it.
    static ChartPalette Of(Rgb back, Rgb text, Rgb highlight);
    static ChartPalette OfSystem();  // as the theme is now: dark or light

    Rgb back;
    Rgb text;
    Rgb grid;   // seen, but behind everything
    Rgb empty;  // what a bar could still fill
    Rgb focus;
    std::array<Rgb, 2> lines;
};
}  // namespace desk
