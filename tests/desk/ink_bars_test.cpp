#include "desk/view/InkBars.h"

#include "tests/desk/Picture.h"
#include <gtest/gtest.h>
#include <wx/frame.h>

using namespace desk;

namespace
{
constexpr Rgb Red{200, 16, 32};
constexpr Rgb Blue{16, 32, 200};
constexpr Rgb Green{16, 160, 32};

class InkBarsTest : public testing::TestWithParam<ChartPalette>
{
protected:
    ~InkBarsTest() override { delete m_frame; }

    void Show(std::vector<comgui::SnapshotEntry> entries)
    {
        InkCoverage coverage;
        coverage.Take(comgui::Snapshot(std::move(entries)));
        m_bars->Take(coverage);
    }
    void ShowThree()
    {
        Show({{"Job/Inks/Acid/Coverage", 100},
              {"Job/Inks/Acid/Colour", "#C81020"},
              {"Job/Inks/Bone/Coverage", 50},
              {"Job/Inks/Bone/Colour", "#1020C8"},
              {"Job/Inks/Clay/Coverage", 12.5},
              {"Job/Inks/Clay/Colour", "#10A020"}});
    }
    Picture Paint(wxSize size = {400, 160}, bool isFocused = false) const
    {
        return Picture(m_bars->Picture(size, GetParam(), isFocused));
    }

    wxFrame* m_frame = new wxFrame(nullptr, wxID_ANY, "test");
    InkBars* m_bars = new InkBars(m_frame);
};
}  // namespace

INSTANTIATE_TEST_SUITE_P(Palettes, InkBarsTest, testing::Values(Light, Dark),
                         [](auto const& palette) { return palette.index == 0 ? "Light" : "Dark"; });

TEST_P(InkBarsTest, BarsAreAsWideAsTheirValuesSay)
{
    ShowThree();
    Picture const picture = Paint();
    int const whole = picture.Of(Red).Width();
    ASSERT_GT(whole, 150);
    EXPECT_NEAR(picture.Of(Blue).Width(), whole / 2.0, 3);
    EXPECT_NEAR(picture.Of(Green).Width(), whole / 8.0, 3);
    EXPECT_EQ(picture.Of(Red).left, picture.Of(Blue).left);
    EXPECT_LT(picture.Of(Red).bottom, picture.Of(Blue).top);
    EXPECT_LT(picture.Of(Blue).bottom, picture.Of(Green).top);
}

TEST_P(InkBarsTest, TheGreatestValueFillsTheWidth)
{
    Show({{"Job/Inks/Acid/Coverage", 400},
          {"Job/Inks/Acid/Colour", "#C81020"},
          {"Job/Inks/Bone/Coverage", 100},
          {"Job/Inks/Bone/Colour", "#1020C8"}});
    Picture const picture = Paint();
    ASSERT_GT(picture.Of(Blue).Width(), 30);
    EXPECT_NEAR(picture.Of(Red).Width(), 4.0 * picture.Of(Blue).Width(), 9);
}

TEST_P(InkBarsTest, TextsAreReadable)
{
    ShowThree();
    Picture const picture = Paint();
    EXPECT_EQ(picture.At(0, 0), GetParam().back);
    EXPECT_GE(picture.BestContrast(GetParam().back, 0, picture.Of(Red).left), 4.5);
    EXPECT_GE(picture.BestContrast(GetParam().back, picture.Of(Red).right + 4, picture.Width()), 4.5);
}

TEST_P(InkBarsTest, AnInkLikeTheBackgroundHasAnOutline)
{
    Rgb const back = GetParam().back;
    Show({{"Job/Inks/Acid/Coverage", 50},
          {"Job/Inks/Acid/Colour",
           wxString::Format("#%02X%02X%02X", back.red, back.green, back.blue).ToStdString()}});
    Picture const picture = Paint();
    Extent const outline = picture.Of(Readable(back, back, 3));
    EXPECT_GT(outline.Width(), 50);
}

TEST_P(InkBarsTest, NothingIsDrawnOutside)
{
    ShowThree();
    for (wxSize const size :
         {wxSize(300, 120), wxSize(120, 60), wxSize(200, 14), wxSize(40, 20), wxSize(7, 5)})
        EXPECT_EQ(CountOutside(*m_bars, size), 0) << size.x;
}

TEST_P(InkBarsTest, FromRightToLeftBarsBeginAtTheRight)
{
    ShowThree();
    Extent const before = Paint().Of(Blue);
    m_bars->SetMirrored(true);
    Picture const mirrored = Paint();
    EXPECT_NEAR(mirrored.Of(Blue).right, mirrored.Width() - 1 - before.left, 1);
    EXPECT_NEAR(mirrored.Of(Blue).left, mirrored.Width() - 1 - before.right, 1);
}

TEST_P(InkBarsTest, TheFocusIsVisible)
{
    ShowThree();
    EXPECT_EQ(Paint({200, 100}, true).At(0, 50), GetParam().focus);
    EXPECT_EQ(Paint({200, 100}, false).At(0, 50), GetParam().back);
    EXPECT_GE(ContrastOf(GetParam().focus, GetParam().back), 3);
}

TEST_P(InkBarsTest, OfTooManyInksThoseAreDrawnThatFit)
{
    std::vector<comgui::SnapshotEntry> entries;
    for (int i = 10; i < 60; ++i)
    {
        std::string const key = "Job/Inks/Spot " + std::to_string(i);
        entries.push_back({key + "/Coverage", 100});
        entries.push_back({key + "/Colour", i == 10 ? "#C81020" : i == 59 ? "#1020C8" : "#808080"});
    }
    Show(std::move(entries));
    Picture const picture = Paint({400, 120});
    EXPECT_GT(picture.Of(Red).count, 0);
    EXPECT_EQ(picture.Of(Blue).count, 0);
    EXPECT_TRUE(m_bars->GetLabel().Contains("Spot 59"));
}

TEST_P(InkBarsTest, WordsTellTheValues)
{
    EXPECT_EQ(m_bars->GetLabel(), "No ink coverage is known");
    Show({{"Job/Inks/Cyan/Coverage", 12.5}, {"Job/Inks/A\nB\xE2\x80\xAE/Coverage", 30}});
    wxString const label = m_bars->GetLabel();
    EXPECT_TRUE(label.StartsWith("Ink coverage: Cyan 12.5 %, ")) << label;
    EXPECT_TRUE(label.EndsWith(" 30.0 %; total 42.5 %")) << label;
    EXPECT_FALSE(label.Contains("\n"));
    EXPECT_FALSE(label.Contains(wxUniChar(0x202E)));
}

TEST_P(InkBarsTest, WantsMoreHeightForMoreInks)
{
    int const before = m_bars->GetBestSize().y;
    ShowThree();
    EXPECT_GT(m_bars->GetBestSize().y, before + 30);
}
