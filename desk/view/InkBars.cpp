#include "desk/view/InkBars.h"

#include "desk/view/NumberText.h"
#include "desk/view/ShownText.h"
#include <algorithm>
#include <wx/intl.h>

namespace desk
{
namespace
{
constexpr std::size_t NameLength = 60;
constexpr double Outlined = 3;         // contrast of a bar's outline
constexpr double GreatestName = 0.35;  // of the width

double RowHeight(ChartPainter const& painter) { return painter.LineHeight() + 6 * painter.Unit(); }
}  // namespace

InkBars::InkBars(wxWindow* parent) : ChartWindow(parent, "inks", {160, 60}) {}

void InkBars::Take(InkCoverage const& coverage)
{
    m_bars.clear();
    m_greatest = 100;
    for (Ink const& ink : coverage.Inks())
    {
        m_bars.push_back(
            {ShownText(ink.name, NameLength), PercentText(ink.coverage), ink.coverage, ink.colour});
        m_greatest = std::max(m_greatest, ink.coverage);
    }
    m_total = PercentText(coverage.Total());
    InvalidateBestSize();
    Changed();
}

wxString InkBars::GetLabel() const
{
    if (m_bars.empty())
        return _("No ink coverage is known");
    wxString inks;
    for (BAR const& bar : m_bars)
        inks += wxString::Format(m_bars.data() == &bar ? "%s %s" : ", %s %s", bar.name, bar.value);
    return wxString::Format(_("Ink coverage: %s; total %s"), inks, m_total);
}

wxSize InkBars::DoGetBestClientSize() const
{
    int const row = GetCharHeight() + FromDIP(6);
    return {FromDIP(260), row * (static_cast<int>(m_bars.size()) + 1) + FromDIP(8)};
}

void InkBars::Draw(ChartPainter& painter) const
{
    double const padding = 4 * painter.Unit();
    wxRect2DDouble area = painter.Area();
    area.Inset(padding, padding);
    if (m_bars.empty())
        return painter.Text(GetLabel(), area, TextSide::Middle, painter.Palette().text);

    double const height = RowHeight(painter);
    auto const room =
        static_cast<std::size_t>(std::max(area.m_height / height, 1.0)) - 1;  // one for the total
    std::size_t const shown = std::min(room, m_bars.size());
    double nameWidth = 0;
    for (std::size_t i = 0; i < shown; ++i)
        nameWidth = std::max(nameWidth, painter.WidthOf(m_bars[i].name));
    nameWidth = std::min(nameWidth, area.m_width * GreatestName);
    for (std::size_t i = 0; i < shown; ++i)
        DrawRow(painter, m_bars[i],
                {area.m_x, area.m_y + height * static_cast<double>(i), area.m_width, height}, nameWidth);

    wxString const total =
        shown == m_bars.size()
            ? wxString(_("Total"))
            : wxString::Format(wxPLURAL("Total of %zu ink", "Total of %zu inks", PluralOf(m_bars.size())),
                               m_bars.size());
    wxRect2DDouble const last(area.m_x, area.m_y + height * static_cast<double>(shown), area.m_width, height);
    double const valueWidth = painter.WidthOf(m_total);
    painter.Text(m_total, last, TextSide::End, painter.Palette().text);
    painter.Text(total, {last.m_x, last.m_y, last.m_width - valueWidth - padding, last.m_height},
                 TextSide::Begin, painter.Palette().text);
}

void InkBars::DrawRow(ChartPainter& painter, BAR const& bar, wxRect2DDouble row, double nameWidth) const
{
    ChartPalette const& palette = painter.Palette();
    double const gap = 4 * painter.Unit();
    double const valueWidth = painter.WidthOf(PercentText(1000));
    wxRect2DDouble const whole(row.m_x + nameWidth + gap, row.m_y + gap / 2,
                               std::max(row.m_width - nameWidth - valueWidth - 2 * gap, 0.0),
                               row.m_height - gap);
    painter.Text(bar.name, {row.m_x, row.m_y, nameWidth, row.m_height}, TextSide::Begin, palette.text);
    painter.Text(bar.value, row, TextSide::End, palette.text);
    painter.Box(whole, palette.empty);
    wxRect2DDouble filled = whole;
    filled.m_width *= bar.coverage / m_greatest;
    painter.Box(filled, bar.colour, Readable(bar.colour, palette.back, Outlined));
}
}  // namespace desk
