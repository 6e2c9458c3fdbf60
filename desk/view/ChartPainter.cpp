#include "desk/view/ChartPainter.h"

#include <algorithm>
#include <cmath>
#include <wx/arrstr.h>
#include <wx/brush.h>
#include <wx/pen.h>

namespace desk
{
namespace
{
wxColour ToColour(Rgb colour) { return {colour.red, colour.green, colour.blue}; }
}  // namespace

ChartPainter::ChartPainter(wxGraphicsContext& context, wxSize size, ChartPalette const& palette,
                           wxFont const& font, double unit, bool isMirrored)
    : m_context(context), m_palette(palette), m_font(font), m_width(size.x), m_height(size.y), m_unit(unit),
      m_isMirrored(isMirrored)
{
    m_context.SetFont(m_font, ToColour(palette.text));
    double width = 0;
    double descent = 0;
    double leading = 0;
    m_context.GetTextExtent("Ag", &width, &m_lineHeight, &descent, &leading);
    m_context.EnableOffset(false);  // places here are the middles of pixels where it matters
    m_context.Clip(0, 0, m_width, m_height);
    Box(Area(), palette.back);
}

wxPoint2DDouble ChartPainter::Placed(wxPoint2DDouble point) const
{
    return {m_isMirrored ? m_width - point.m_x : point.m_x, point.m_y};
}

wxRect2DDouble ChartPainter::Placed(wxRect2DDouble box) const
{
    if (m_isMirrored)
        box.m_x = m_width - box.m_x - box.m_width;
    return box;
}

double ChartPainter::WidthOf(wxString const& text) const
{
    double width = 0;
    double height = 0;
    m_context.GetTextExtent(text, &width, &height);
    return width;
}

void ChartPainter::Box(wxRect2DDouble box, Rgb fill, std::optional<Rgb> outline)
{
    box = Placed(box);
    m_context.SetBrush(wxBrush(ToColour(fill)));
    m_context.SetPen(*wxTRANSPARENT_PEN);
    m_context.DrawRectangle(box.m_x, box.m_y, std::max(box.m_width, 0.0), std::max(box.m_height, 0.0));
    if (!outline || box.m_width < 2 || box.m_height < 2)
        return;
    m_context.SetBrush(*wxTRANSPARENT_BRUSH);
    m_context.SetPen(wxPen(ToColour(*outline)));
    m_context.DrawRectangle(box.m_x + 0.5, box.m_y + 0.5, box.m_width - 1, box.m_height - 1);
}

void ChartPainter::Line(wxPoint2DDouble from, wxPoint2DDouble to, Rgb colour)
{
    if (from.m_x == to.m_x)
        from.m_x = to.m_x = std::floor(from.m_x) + 0.5;
    if (from.m_y == to.m_y)
        from.m_y = to.m_y = std::floor(from.m_y) + 0.5;
    Curve({from, to}, colour, 1);
}

wxGraphicsPath ChartPainter::PathOf(std::vector<wxPoint2DDouble> const& points) const
{
    wxGraphicsPath path = m_context.CreatePath();
    for (std::size_t i = 0; i < points.size(); ++i)
        i == 0 ? path.MoveToPoint(Placed(points[i])) : path.AddLineToPoint(Placed(points[i]));
    return path;
}

void ChartPainter::Curve(std::vector<wxPoint2DDouble> const& points, Rgb colour, double width)
{
    m_context.SetPen(m_context.CreatePen(wxGraphicsPenInfo(ToColour(colour), width).Join(wxJOIN_ROUND)));
    m_context.StrokePath(PathOf(points));
}

void ChartPainter::Surface(std::vector<wxPoint2DDouble> const& corners, Rgb colour, double strength)
{
    wxGraphicsPath path = PathOf(corners);
    path.CloseSubpath();
    auto const alpha = static_cast<unsigned char>(255 * strength);
    m_context.SetBrush(wxBrush(wxColour(colour.red, colour.green, colour.blue, alpha)));
    m_context.FillPath(path);
}

wxString ChartPainter::Cut(wxString const& text, double width) const
{
    if (WidthOf(text) <= width)
        return text;
    wxString const ellipsis(wxUniChar(0x2026));
    wxArrayDouble ends;
    m_context.GetPartialTextExtents(text, ends);
    double const room = width - WidthOf(ellipsis);
    auto const fitting = std::ranges::upper_bound(ends, room) - ends.begin();
    return room <= 0 ? wxString() : text.Left(static_cast<std::size_t>(fitting)) + ellipsis;
}

void ChartPainter::Text(wxString const& text, wxRect2DDouble area, TextSide side, Rgb colour)
{
    wxString const shown = Cut(text, area.m_width);
    if (shown.empty())
        return;
    double const rest = area.m_width - WidthOf(shown);
    double const share = side == TextSide::Begin ? 0 : side == TextSide::Middle ? 0.5 : 1;
    wxRect2DDouble const box =
        Placed(wxRect2DDouble(area.m_x + rest * share, area.m_y, area.m_width - rest, area.m_height));
    m_context.SetFont(m_font, ToColour(colour));
    m_context.DrawText(shown, box.m_x, box.m_y + (box.m_height - m_lineHeight) / 2);
}

void ChartPainter::FocusRing()
{
    double const width = 2 * m_unit;
    m_context.SetBrush(*wxTRANSPARENT_BRUSH);
    m_context.SetPen(m_context.CreatePen(wxGraphicsPenInfo(ToColour(m_palette.focus), width)));
    m_context.DrawRectangle(width / 2, width / 2, m_width - width, m_height - width);
}
}  // namespace desk
