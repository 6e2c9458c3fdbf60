// Colours that stay readable on any background. Plain values; no colour of a screen is known here.
#pragma once

namespace desk
{
struct Rgb
{
    unsigned char red = 0;
    unsigned char green = 0;
    unsigned char blue = 0;

    bool operator==(Rgb const&) const = default;
};

// How bright it looks: 0 black to 1 white.
double Luminance(Rgb colour);

// 1 for the same colour to 21 for black on white. Texts need 4.5, large shapes 3.
double ContrastOf(Rgb one, Rgb other);

// The colour itself, or what comes of it on the way to black or white when that is needed for the contrast
// with back; the better of both where neither reaches it.
Rgb Readable(Rgb colour, Rgb back, double contrast);

// share: 0 from, 1 to.
Rgb Mixed(Rgb from, Rgb to, double share);
}  // namespace desk
