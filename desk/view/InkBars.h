// The ink coverage of a job, a bar each, and their total.
#pragma once

#include "desk/model/InkCoverage.h"
#include "desk/view/ChartWindow.h"
#include <vector>

namespace desk
{
class InkBars : public ChartWindow
{
public:
    explicit InkBars(wxWindow* parent);

    void Take(InkCoverage const& coverage);

    wxString GetLabel() const override;

protected:
    wxSize DoGetBestClientSize() const override;

private:
    struct BAR
    {
        wxString name;
        wxString value;
        double coverage;
        Rgb colour;
    };

    void Draw(ChartPainter& painter) const override;
    void DrawRow(ChartPainter& painter, BAR const& bar, wxRect2DDouble row, double nameWidth) const;

    std::vector<BAR> m_bars;
    wxString m_total;
    double m_greatest = 100;  // percent; that a whole bar stands for
};
}  // namespace desk
