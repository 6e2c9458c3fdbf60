// A picture that a view has painted, and what can be found in it.
#pragma once

#include "desk/view/ChartWindow.h"
#include <algorithm>
#include <cstdlib>
#include <memory>
#include <wx/dcmemory.h>
#include <wx/image.h>

namespace desk
{
// Two themes as systems have them.
inline ChartPalette const Light = ChartPalette::Of({255, 255, 255}, {30, 30, 30}, {53, 132, 228});
inline ChartPalette const Dark = ChartPalette::Of({36, 36, 36}, {238, 238, 236}, {21, 83, 158});

// Where pixels of a colour are; nothing is below 0.
struct Extent
{
    int left = -1;
    int top = -1;
    int right = -1;
    int bottom = -1;
    int count = 0;

    int Width() const { return count == 0 ? 0 : right - left + 1; }
};

class Picture
{
public:
    explicit Picture(wxBitmap const& bitmap) : m_image(bitmap.ConvertToImage()) {}

    int Width() const { return m_image.GetWidth(); }
    int Height() const { return m_image.GetHeight(); }

    Rgb At(int x, int y) const
    {
        return {m_image.GetRed(x, y), m_image.GetGreen(x, y), m_image.GetBlue(x, y)};
    }

    Extent Of(Rgb colour) const
    {
        Extent extent;
        for (int y = 0; y < Height(); ++y)
            for (int x = 0; x < Width(); ++x)
                if (IsLike(At(x, y), colour))
                    Add(extent, x, y);
        return extent;
    }

    // How well the clearest pixel of the columns can be seen.
    double BestContrast(Rgb back, int left, int right) const
    {
        double best = 1;
        for (int y = 0; y < Height(); ++y)
            for (int x = std::max(left, 0); x < std::min(right, Width()); ++x)
                best = std::max(best, ContrastOf(At(x, y), back));
        return best;
    }

private:
    static bool IsLike(Rgb one, Rgb other)
    {
        return std::abs(one.red - other.red) < 4 && std::abs(one.green - other.green) < 4 &&
               std::abs(one.blue - other.blue) < 4;
    }
    static void Add(Extent& extent, int x, int y)
    {
        bool const isFirst = extent.count++ == 0;
        extent.left = isFirst ? x : std::min(extent.left, x);
        extent.top = isFirst ? y : std::min(extent.top, y);
        extent.right = std::max(extent.right, x);
        extent.bottom = std::max(extent.bottom, y);
    }

    wxImage m_image;
};

// How many pixels outside the size a view has changed that was to paint within it.
inline int CountOutside(ChartWindow const& view, wxSize size)
{
    constexpr Rgb Untouched{255, 0, 255};
    wxBitmap bitmap(size + size, 24);
    {
        wxMemoryDC dc(bitmap);
        dc.SetBackground(wxBrush(wxColour(Untouched.red, Untouched.green, Untouched.blue)));
        dc.Clear();
        std::unique_ptr<wxGraphicsContext> const context(wxGraphicsContext::Create(dc));
        view.Paint(*context, size, Light, true);
    }
    int const whole = 4 * size.x * size.y;
    return whole - size.x * size.y - Picture(bitmap).Of(Untouched).count;
}
}  // namespace desk
