#include "desk/view/HistoryPlot.h"

#include "desk/view/NumberText.h"
#include <algorithm>
#include <wx/intl.h>

namespace desk
{
namespace
{
// Below these sizes, in device-independent pixels, the curve needs the room more than its labels do.
constexpr double WidthForLabels = 180;
constexpr double HeightForTimes = 90;
constexpr double HeightForHeading = 50;
constexpr double Filled = 0.15;
}  // namespace

HistoryPlot::HistoryPlot(wxWindow* parent) : ChartWindow(parent, "history", {120, 60})
{
    Bind(wxEVT_MOTION,
         [this](wxMouseEvent& event)
         {
             if (wxString const text = TextAt(event.GetX()); text != GetToolTipText())
                 SetToolTip(text);
             event.Skip();
         });
}

void HistoryPlot::Take(std::vector<PlotLine> lines)
{
    m_lines = std::move(lines);
    m_lines.resize(std::min<std::size_t>(m_lines.size(), 2));
    Changed();
}

bool HistoryPlot::IsEmpty() const
{
    return std::ranges::all_of(m_lines, [](PlotLine const& line) { return line.series.IsEmpty(); });
}

wxString HistoryPlot::GetLabel() const
{
    if (IsEmpty())
        return _("No history yet");
    wxString words;
    for (PlotLine const& line : m_lines)
        if (!line.series.IsEmpty())
            words += wxString::Format(_("%s: now %s, least %s, most %s") + "; ", line.name,
                                      line.text(line.series.Last()), line.text(line.series.Lowest()),
                                      line.text(line.series.Highest()));
    auto const [begin, end] = Times();
    return words + wxString::Format(_("over %s"), TimeText(end - begin));
}

HistoryPlot::SPAN HistoryPlot::Times() const
{
    SPAN span{0, 0};
    bool isFirst = true;
    for (PlotLine const& line : m_lines)
    {
        if (line.series.IsEmpty())
            continue;
        double const begin = line.series.Points().front().time;
        double const end = line.series.Points().back().time;
        span = isFirst ? SPAN{begin, end} : SPAN{std::min(span.begin, begin), std::max(span.end, end)};
        isFirst = false;
    }
    return {span.begin, std::max(span.end, span.begin + 1)};
}

wxString HistoryPlot::TextAt(int x) const
{
    if (IsEmpty() || m_plot.m_width <= 0)
        return {};
    double const place = IsMirrored() ? GetClientSize().x - x : x;
    double const share = std::clamp((place - m_plot.m_x) / m_plot.m_width, 0.0, 1.0);
    auto const [begin, end] = Times();
    double const time = begin + share * (end - begin);
    wxString text = TimeText(time - begin);
    for (PlotLine const& line : m_lines)
        if (TimePoint const* const point = line.series.Nearest(time))
            text += "\n" + line.name + ": " + line.text(point->value);
    return text;
}

void HistoryPlot::Draw(ChartPainter& painter) const
{
    m_plot = {};
    if (IsEmpty())
        return painter.Text(GetLabel(), painter.Area(), TextSide::Middle, painter.Palette().text);
    wxRect2DDouble const area = DrawHeading(painter);
    std::vector<NiceScale> scales;
    for (PlotLine const& line : m_lines)
        scales.emplace_back(std::min(line.series.Lowest(), 0.0), line.series.Highest(),
                            static_cast<int>(area.m_height), static_cast<int>(2 * painter.LineHeight()),
                            line.quantity);
    m_plot = DrawAxes(painter, area, scales);
    for (std::size_t i = 0; i < m_lines.size(); ++i)
        DrawLine(painter, m_plot, i, scales[i]);
}

// The lines' names with their latest values; gives what is left.
wxRect2DDouble HistoryPlot::DrawHeading(ChartPainter& painter) const
{
    wxRect2DDouble area = painter.Area();
    area.Inset(4 * painter.Unit(), 4 * painter.Unit());
    if (area.m_height < HeightForHeading * painter.Unit())
        return area;
    double const width = area.m_width / static_cast<double>(m_lines.size());
    for (std::size_t i = 0; i < m_lines.size(); ++i)
    {
        PlotLine const& line = m_lines[i];
        wxString const last = line.series.IsEmpty() ? wxString() : line.text(line.series.Last());
        wxString const whole = last.empty() ? line.name : line.name + ": " + last;
        wxString const text = last.empty() || painter.WidthOf(whole) <= width ? whole : last;
        painter.Text(text, {area.m_x + width * static_cast<double>(i), area.m_y, width, painter.LineHeight()},
                     i == 0 ? TextSide::Begin : TextSide::End, painter.Palette().lines[i]);
    }
    area.Inset(0, painter.LineHeight() + 2 * painter.Unit(), 0, 0);
    return area;
}

// Gives where the lines go.
wxRect2DDouble HistoryPlot::DrawAxes(ChartPainter& painter, wxRect2DDouble area,
                                     std::vector<NiceScale> const& scales) const
{
    bool const isLabelled = area.m_width >= WidthForLabels * painter.Unit();
    bool const isTimed = area.m_height >= HeightForTimes * painter.Unit();
    double const gap = 4 * painter.Unit();
    double widths[2] = {};
    for (std::size_t i = 0; isLabelled && i < scales.size(); ++i)
        for (double const tick : scales[i].Ticks())
            widths[i] = std::max(
                widths[i], painter.WidthOf(NumberText(scales[i].Label(tick), m_lines[i].quantity)) + gap);
    double const half = isLabelled ? painter.LineHeight() / 2 : 0;
    wxRect2DDouble plot = area;
    plot.Inset(widths[0], half, widths[1], isTimed ? painter.LineHeight() + gap : half);

    for (std::size_t i = 0; i < scales.size(); ++i)
        for (double const tick : scales[i].Ticks())
        {
            double const y = plot.GetBottom() - scales[i].Share(tick) * plot.m_height;
            if (i == 0)
                painter.Line({plot.m_x, y}, {plot.GetRight(), y}, painter.Palette().grid);
            if (!isLabelled)
                continue;
            wxRect2DDouble const label(i == 0 ? area.m_x : plot.GetRight() + gap, y - half, widths[i] - gap,
                                       2 * half);
            painter.Text(NumberText(scales[i].Label(tick), m_lines[i].quantity), label,
                         i == 0 ? TextSide::End : TextSide::Begin, painter.Palette().text);
        }
    DrawTimes(painter, plot, isTimed);
    return plot;
}

void HistoryPlot::DrawTimes(ChartPainter& painter, wxRect2DDouble plot, bool isWritten) const
{
    auto const [begin, end] = Times();
    double const span = end - begin;
    double const room = painter.WidthOf(TimeText(span)) * 2;
    NiceScale const scale(0, span, static_cast<int>(plot.m_width), static_cast<int>(room));
    for (double const tick : scale.Ticks())
    {
        double const x = plot.m_x + tick / span * plot.m_width;
        if (x > plot.GetRight() + 0.5)
            break;
        painter.Line({x, plot.m_y}, {x, plot.GetBottom()}, painter.Palette().grid);
        double const width = room / 2;
        double const left = std::clamp(x - width / 2, plot.m_x, std::max(plot.GetRight() - width, plot.m_x));
        if (isWritten)
            painter.Text(TimeText(tick),
                         {left, plot.GetBottom() + 2 * painter.Unit(), width, painter.LineHeight()},
                         TextSide::Middle, painter.Palette().text);
    }
}

void HistoryPlot::DrawLine(ChartPainter& painter, wxRect2DDouble plot, std::size_t index,
                           NiceScale const& scale) const
{
    auto const [begin, end] = Times();
    auto const place = [&, from = begin, span = end - begin](double time, double value)
    {
        return wxPoint2DDouble(plot.m_x + (time - from) / span * plot.m_width,
                               plot.GetBottom() - scale.Share(value) * plot.m_height);
    };
    Rgb const colour = painter.Palette().lines[index];
    std::vector<wxPoint2DDouble> curve;
    for (TimePoint const& point : m_lines[index].series.Points())
        curve.push_back(place(point.time, point.value));
    if (curve.empty())
        return;
    if (index == 0)
    {
        auto surface = curve;
        surface.push_back({curve.back().m_x, plot.GetBottom()});
        surface.push_back({curve.front().m_x, plot.GetBottom()});
        painter.Surface(surface, colour, Filled);
    }
    for (TimePoint const& point : m_lines[index].series.Points())
        if (point.low < point.high)
            painter.Line(place(point.time, point.low), place(point.time, point.high), colour);
    painter.Curve(curve, colour, 2 * painter.Unit());
}
}  // namespace desk
