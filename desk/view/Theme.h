// Colours that tell something, readable on whatever background the system's theme has.
#pragma once

#include <wx/colour.h>

namespace desk
{
enum class Accent
{
    Changed,     // behind a row that has just changed
    Difference,  // behind a value that differs from the other
    Good,        // text
    Bad,         // text
};

// strength: 1 in full, down to 0, which is the background itself.
wxColour ColourOf(Accent accent, double strength = 1);

bool IsDark();  // the system's lists
}  // namespace desk
