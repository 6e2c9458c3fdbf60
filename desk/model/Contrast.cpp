#include "desk/model/Contrast.h"

#include <algorithm>
#include <cmath>

namespace desk
{
namespace
{
// A channel's share of light; screens store it bent, as the eye sees it.
double Light(unsigned char channel)
{
    double const share = channel / 255.0;
    return share <= 0.04045 ? share / 12.92 : std::pow((share + 0.055) / 1.055, 2.4);
}

unsigned char Mixed(unsigned char from, unsigned char to, double share)
{
    return static_cast<unsigned char>(std::lround(from + (to - from) * share));
}
}  // namespace

double Luminance(Rgb colour)
{
    return 0.2126 * Light(colour.red) + 0.7152 * Light(colour.green) + 0.0722 * Light(colour.blue);
}

double ContrastOf(Rgb one, Rgb other)
{
    auto const [dark, bright] = std::minmax({Luminance(one), Luminance(other)});
    return (bright + 0.05) / (dark + 0.05);
}

Rgb Mixed(Rgb from, Rgb to, double share)
{
    share = std::clamp(share, 0.0, 1.0);
    return {Mixed(from.red, to.red, share), Mixed(from.green, to.green, share),
            Mixed(from.blue, to.blue, share)};
}

Rgb Readable(Rgb colour, Rgb back, double contrast)
{
    Rgb const black{0, 0, 0};
    Rgb const white{255, 255, 255};
    Rgb const end = ContrastOf(black, back) > ContrastOf(white, back) ? black : white;
    constexpr int Steps = 32;
    for (int step = 0; step < Steps; ++step)
        if (Rgb const mixed = Mixed(colour, end, static_cast<double>(step) / Steps);
            ContrastOf(mixed, back) >= contrast)
            return mixed;
    return end;
}
}  // namespace desk
