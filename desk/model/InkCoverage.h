// How much of a sheet each ink of a job covers, from the keys of the job's ticket. A plain value.
//
// The keys, written by a server or a script:
//   "Job/Inks/NAME/Coverage"  a number of any type: percent of the sheet, 0 to 100; up to 1000 where an ink
//   is
//                             applied several times
//   "Job/Inks/NAME/Colour"    a text, "#RRGGBB"; may be missing
// Or, as two lists of the same positions; what the keys above say counts more:
//   "Job/Separations"         texts: the names
//   "Job/InkCoverage"         doubles: shares of the sheet, 0 to 1; up to 10
// NAME has 1 to 200 bytes and no slash. Anything else is as if it were not there: a coverage that is
// negative, above 1000, not a number or a text; a colour of another form. An ink without a coverage is no
// ink.
#pragma once

#include "desk/model/Contrast.h"
#include <comgui/client/Event.h>
#include <comgui/client/Snapshot.h>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace desk
{
struct Ink
{
    std::string name;  // as in the key: from others, not fit to be shown as it is
    double coverage;   // percent
    Rgb colour;        // the ticket's, else that of the process ink, else grey
};

class InkCoverage
{
public:
    static constexpr std::size_t GreatestCount = 100;  // further inks are left out

    void Take(comgui::Snapshot const& ticket);  // instead of all before

    // Process inks first, in the order of printing: Cyan, Magenta, Yellow, Black, Orange, Green, Violet,
    // White, Varnish, in any letter case; then the others by name, bytewise. Valid until the next Take.
    std::vector<Ink> const& Inks() const { return m_inks; }

    double Total() const;  // of all inks: 400 where four cover the whole sheet

private:
    struct PARTS
    {
        std::optional<double> coverage;
        std::optional<Rgb> colour;
    };

    void TakeLists(comgui::Snapshot const& ticket);
    void Set(std::string_view key, comgui::Value const& value);
    void Arrange();

    std::map<std::string, PARTS, std::less<>> m_parts;
    std::vector<Ink> m_inks;
};
}  // namespace desk
