#include "desk/view/NumberText.h"

#include <algorithm>
#include <wx/intl.h>
#include <wx/numformatter.h>

namespace desk
{
namespace
{
constexpr double Longest = 359999;  // 99:59:59

wxString UnitOf(int power, Quantity quantity)
{
    static char const* const Decimal[] = {wxTRANSLATE("B"),  wxTRANSLATE("kB"), wxTRANSLATE("MB"),
                                          wxTRANSLATE("GB"), wxTRANSLATE("TB"), wxTRANSLATE("PB"),
                                          wxTRANSLATE("EB")};
    static char const* const Binary[] = {wxTRANSLATE("B"),   wxTRANSLATE("KiB"), wxTRANSLATE("MiB"),
                                         wxTRANSLATE("GiB"), wxTRANSLATE("TiB"), wxTRANSLATE("PiB"),
                                         wxTRANSLATE("EiB")};
    auto const& units = quantity == Quantity::BinaryBytes ? Binary : Decimal;
    return wxGetTranslation(units[std::clamp(power, 0, 6)]);
}
}  // namespace

wxString NumberText(ScaledNumber const& number, Quantity quantity)
{
    wxString const digits = wxNumberFormatter::ToString(number.number, number.digits);
    return quantity == Quantity::Number ? digits : digits + " " + UnitOf(number.power, quantity);
}

wxString BytesText(double bytes)
{
    return NumberText(Scaled(bytes, Quantity::DecimalBytes), Quantity::DecimalBytes);
}

wxString RateText(double bytes) { return wxString::Format(_("%s/s"), BytesText(bytes)); }

wxString PercentText(double percent)
{
    return wxString::Format(_("%s %%"), wxNumberFormatter::ToString(percent, 1));
}

unsigned PluralOf(std::uint64_t count)
{
    constexpr std::uint64_t Digits = 1'000'000;
    return static_cast<unsigned>(count < Digits ? count : Digits + count % Digits);
}

wxString TimeText(double seconds)
{
    int const whole = static_cast<int>(std::clamp(seconds, 0.0, Longest));
    if (whole < 3600)
        return wxString::Format("%d:%02d", whole / 60, whole % 60);
    return wxString::Format("%d:%02d:%02d", whole / 3600, whole / 60 % 60, whole % 60);
}
}  // namespace desk
