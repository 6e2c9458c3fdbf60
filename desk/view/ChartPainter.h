// Draws shapes and texts of a chart within its area. Places are told as in a window that is read from left to
// right; where it is read from right to left they are mirrored here.
#pragma once

#include "desk/view/ChartPalette.h"
#include <optional>
#include <vector>
#include <wx/font.h>
#include <wx/geometry.h>
#include <wx/graphics.h>

namespace desk
{
enum class TextSide
{
    Begin,
    Middle,
    End,
};

class ChartPainter
{
public:
    // unit: pixels of one device-independent pixel.
    ChartPainter(wxGraphicsContext& context, wxSize size, ChartPalette const& palette, wxFont const& font,
                 double unit, bool isMirrored);

    ChartPalette const& Palette() const { return m_palette; }
    wxRect2DDouble Area() const { return {0, 0, m_width, m_height}; }
    double Unit() const { return m_unit; }
    double LineHeight() const { return m_lineHeight; }
    double WidthOf(wxString const& text) const;

    void Box(wxRect2DDouble box, Rgb fill, std::optional<Rgb> outline = {});
    void Line(wxPoint2DDouble from, wxPoint2DDouble to, Rgb colour);  // sharp if it is level or upright
    void Curve(std::vector<wxPoint2DDouble> const& points, Rgb colour, double width);

    // strength: 1 covers what lies below, 0 leaves it.
    void Surface(std::vector<wxPoint2DDouble> const& corners, Rgb colour, double strength);

    // One line in the middle of the area's height; what does not fit is cut with an ellipsis.
    void Text(wxString const& text, wxRect2DDouble area, TextSide side, Rgb colour);

    void FocusRing();

private:
    wxPoint2DDouble Placed(wxPoint2DDouble point) const;
    wxRect2DDouble Placed(wxRect2DDouble box) const;
    wxGraphicsPath PathOf(std::vector<wxPoint2DDouble> const& points) const;
    wxString Cut(wxString const& text, double width) const;

    wxGraphicsContext& m_context;
    ChartPalette const& m_palette;
    wxFont const m_font;
    double const m_width;
    double const m_height;
    double const m_unit;
    bool const m_isMirrored;
    double m_lineHeight = 0;
};
}  // namespace desk
