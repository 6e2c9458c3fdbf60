// Numbers with their units as a user reads them, in his language.
#pragma once

#include "desk/model/NiceScale.h"
#include <cstdint>
#include <wx/string.h>

namespace desk
{
wxString NumberText(ScaledNumber const& number, Quantity quantity);  // "1.50 MB"
wxString BytesText(double bytes);                                    // "1.50 MB"
wxString RateText(double bytes);                                     // "1.50 MB/s"
wxString PercentText(double percent);                                // "12.5 %"
wxString TimeText(double seconds);                                   // "0:05", "1:02:03"; not negative

// For wxPLURAL, which takes 32 bits. No language looks further than at the last six digits, and at whether
// there are more.
unsigned PluralOf(std::uint64_t count);
}  // namespace desk
