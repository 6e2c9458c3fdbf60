#include "desk/view/HistoryPlot.h"

#include "desk/view/NumberText.h"
#include "tests/desk/Picture.h"
#include <gtest/gtest.h>
#include <wx/frame.h>

using namespace desk;

namespace
{
TimeSeries Rising(double to, int count = 100)
{
    TimeSeries series;
    for (int i = 0; i <= count; ++i)
        series.Add(i, to * i / count);
    return series;
}

class HistoryPlotTest : public testing::TestWithParam<ChartPalette>
{
protected:
    ~HistoryPlotTest() override { delete m_frame; }

    void ShowBoth() const
    {
        m_plot->Take({{"Rate", Rising(5e6), Quantity::DecimalBytes, &RateText},
                      {"Progress", Rising(100), Quantity::Number, &PercentText}});
    }
    void ShowOne() const { m_plot->Take({{"Rate", Rising(5e6), Quantity::DecimalBytes, &RateText}}); }
    Picture Paint(wxSize size = {400, 200}) const { return Picture(m_plot->Picture(size, GetParam())); }

    wxFrame* m_frame = new wxFrame(nullptr, wxID_ANY, "test");
    HistoryPlot* m_plot = new HistoryPlot(m_frame);
};
}  // namespace

INSTANTIATE_TEST_SUITE_P(Palettes, HistoryPlotTest, testing::Values(Light, Dark),
                         [](auto const& palette) { return palette.index == 0 ? "Light" : "Dark"; });

TEST_P(HistoryPlotTest, ARisingLineRises)
{
    ShowOne();
    for (wxSize const size : {wxSize(400, 200), wxSize(120, 60)})
    {
        Picture const picture = Paint(size);
        // The highest clear pixel below the heading.
        auto const topAt = [&](int x)
        {
            constexpr int Heading = 24;
            int y = Heading;
            while (y < picture.Height() - 1 && ContrastOf(picture.At(x, y), GetParam().back) < 2.5)
                ++y;
            return y;
        };
        int const early = topAt(size.x * 4 / 10);
        int const late = topAt(size.x * 8 / 10);
        EXPECT_GT(early, late + size.y / 8) << size.x;
        EXPECT_LT(early, size.y * 9 / 10) << size.x;
    }
}

TEST_P(HistoryPlotTest, BothLinesHaveAColourThatIsReadable)
{
    ShowBoth();
    Picture const picture = Paint();
    for (Rgb const colour : GetParam().lines)
    {
        EXPECT_GT(picture.Of(colour).count, 30);
        EXPECT_GE(ContrastOf(colour, GetParam().back), 4.5);
    }
    EXPECT_NE(GetParam().lines[0], GetParam().lines[1]);
    ShowOne();
    EXPECT_EQ(Paint().Of(GetParam().lines[1]).count, 0);
}

TEST_P(HistoryPlotTest, BelowTheFirstLineIsALightFill)
{
    ShowOne();
    EXPECT_GT(Paint().Of(Mixed(GetParam().back, GetParam().lines[0], 0.15)).count, 3000);
}

TEST_P(HistoryPlotTest, ThereIsAGridOfLevelAndUprightLines)
{
    ShowOne();
    Picture const picture = Paint();
    auto const isGrid = [&](int x, int y) { return picture.At(x, y) == GetParam().grid; };
    int level = 0;
    int upright = 0;
    for (int y = 1; y < picture.Height(); ++y)
        for (int x = 1; x < picture.Width(); ++x)
        {
            level += isGrid(x, y) && isGrid(x - 1, y) ? 1 : 0;
            upright += isGrid(x, y) && isGrid(x, y - 1) ? 1 : 0;
        }
    EXPECT_GT(level, 200);
    EXPECT_GT(upright, 100);
}

TEST_P(HistoryPlotTest, NothingIsDrawnOutside)
{
    ShowBoth();
    for (wxSize const size :
         {wxSize(300, 120), wxSize(120, 60), wxSize(200, 14), wxSize(40, 20), wxSize(7, 5)})
        EXPECT_EQ(CountOutside(*m_plot, size), 0) << size.x;
}

TEST_P(HistoryPlotTest, TheValueAtThePointerIsSaid)
{
    EXPECT_EQ(m_plot->TextAt(10), "");
    ShowBoth();
    Paint();
    EXPECT_EQ(m_plot->TextAt(-50), "0:00\nRate: 0 B/s\nProgress: 0.0 %");
    EXPECT_EQ(m_plot->TextAt(5000), "1:40\nRate: 5.00 MB/s\nProgress: 100.0 %");
}

TEST_P(HistoryPlotTest, WordsTellTheValues)
{
    EXPECT_EQ(m_plot->GetLabel(), "No history yet");
    ShowOne();
    EXPECT_EQ(m_plot->GetLabel(), "Rate: now 5.00 MB/s, least 0 B/s, most 5.00 MB/s; over 1:40");
}

TEST_P(HistoryPlotTest, OneValueIsEnoughAndNoneIsSaidSo)
{
    EXPECT_GE(Paint().BestContrast(GetParam().back, 0, 400), 4.5);
    TimeSeries series;
    series.Add(5, 7);
    m_plot->Take({{"Rate", series, Quantity::Number, &PercentText},
                  {"Progress", TimeSeries(), Quantity::Number, &PercentText}});
    EXPECT_GT(Paint().Of(GetParam().lines[0]).count, 10);
    EXPECT_EQ(m_plot->GetLabel(), "Rate: now 7.0 %, least 7.0 %, most 7.0 %; over 0:01");
}
