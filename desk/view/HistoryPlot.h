// One or two values over time, each with an axis of its own.
#pragma once

#include "desk/model/NiceScale.h"
#include "desk/model/TimeSeries.h"
#include "desk/view/ChartWindow.h"
#include <functional>
#include <vector>

namespace desk
{
struct PlotLine
{
    wxString name;
    TimeSeries series;
    Quantity quantity = Quantity::Number;
    std::function<wxString(double)> text;  // a value with its unit
};

class HistoryPlot : public ChartWindow
{
public:
    explicit HistoryPlot(wxWindow* parent);

    // Up to two; the others are not shown.
    void Take(std::vector<PlotLine> lines);

    wxString GetLabel() const override;

    // What is to be said at that place of the window as it is now: the values nearest to it in time.
    wxString TextAt(int x) const;

private:
    struct SPAN
    {
        double begin;
        double end;
    };

    void Draw(ChartPainter& painter) const override;
    wxRect2DDouble DrawHeading(ChartPainter& painter) const;
    wxRect2DDouble DrawAxes(ChartPainter& painter, wxRect2DDouble area,
                            std::vector<NiceScale> const& scales) const;
    void DrawTimes(ChartPainter& painter, wxRect2DDouble plot, bool isWritten) const;
    void DrawLine(ChartPainter& painter, wxRect2DDouble plot, std::size_t index,
                  NiceScale const& scale) const;
    SPAN Times() const;
    bool IsEmpty() const;

    std::vector<PlotLine> m_lines;
    mutable wxRect2DDouble m_plot;  // where the last painting had it
};
}  // namespace desk
