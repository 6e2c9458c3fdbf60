#include "desk/model/InkCoverage.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <numeric>

namespace desk
{
namespace
{
constexpr std::string_view Prefix = "Job/Inks/";
constexpr double GreatestCoverage = 1000;
constexpr std::size_t GreatestName = 200;
constexpr Rgb UnknownColour{128, 128, 128};

struct ProcessInk
{
    std::string_view name;  // in small letters
    Rgb colour;
};

constexpr std::array<ProcessInk, 9> ProcessInks{{{"cyan", {0, 158, 224}},
                                                 {"magenta", {226, 0, 122}},
                                                 {"yellow", {255, 228, 0}},
                                                 {"black", {26, 26, 26}},
                                                 {"orange", {242, 122, 0}},
                                                 {"green", {0, 144, 70}},
                                                 {"violet", {100, 58, 150}},
                                                 {"white", {250, 250, 250}},
                                                 {"varnish", {222, 214, 186}}}};

// In ProcessInks; their number for other inks.
std::size_t PlaceOf(std::string_view name)
{
    auto const isSame = [](char small, char any)
    { return small == (any >= 'A' && any <= 'Z' ? static_cast<char>(any - 'A' + 'a') : any); };
    auto const found = std::ranges::find_if(ProcessInks, [&](ProcessInk const& ink)
                                            { return std::ranges::equal(ink.name, name, isSame); });
    return static_cast<std::size_t>(found - ProcessInks.begin());
}

struct InkKey
{
    std::string_view name;
    bool isCoverage;  // else the colour
};

std::optional<InkKey> InkKeyOf(std::string_view key)
{
    if (!key.starts_with(Prefix))
        return std::nullopt;
    key.remove_prefix(Prefix.size());
    auto const slash = key.find('/');
    if (slash == 0 || slash > GreatestName)  // no slash is beyond all
        return std::nullopt;
    std::string_view const what = key.substr(slash + 1);
    if (what != "Coverage" && what != "Colour")
        return std::nullopt;
    return InkKey{key.substr(0, slash), what == "Coverage"};
}

std::optional<double> CoverageOf(comgui::Value const& value)
{
    double const percent = std::visit(
        []<typename T>(T const& held)
        {
            if constexpr (std::is_arithmetic_v<T>)
                return static_cast<double>(held);
            else
                return std::nan("");
        },
        static_cast<comgui::Value::variant const&>(value));
    return percent >= 0 && percent <= GreatestCoverage ? std::optional(percent) : std::nullopt;
}

std::optional<unsigned char> ByteOf(std::string_view digits)
{
    int byte = 0;
    for (char const digit : digits)
    {
        auto const place = std::string_view("0123456789abcdef0123456789ABCDEF").find(digit);
        if (place == std::string_view::npos)
            return std::nullopt;
        byte = byte * 16 + static_cast<int>(place % 16);
    }
    return static_cast<unsigned char>(byte);
}

std::optional<Rgb> ColourOf(comgui::Value const& value)
{
    auto const* const text = std::get_if<std::string>(&value);
    if (!text || text->size() != 7 || text->front() != '#')
        return std::nullopt;
    std::string_view const digits(*text);
    auto const red = ByteOf(digits.substr(1, 2));
    auto const green = ByteOf(digits.substr(3, 2));
    auto const blue = ByteOf(digits.substr(5, 2));
    return red && green && blue ? std::optional(Rgb{*red, *green, *blue}) : std::nullopt;
}
}  // namespace

void InkCoverage::Take(comgui::Snapshot const& ticket)
{
    m_parts.clear();
    TakeLists(ticket);
    auto const& entries = ticket.Entries();
    auto entry = std::ranges::lower_bound(entries, Prefix, {}, &comgui::SnapshotEntry::key);
    for (; entry != entries.end() && entry->key.starts_with(Prefix); ++entry)
        Set(entry->key, entry->value);
    Arrange();
}

void InkCoverage::TakeLists(comgui::Snapshot const& ticket)
{
    comgui::Value const* const names = ticket.Find("Job/Separations");
    comgui::Value const* const shares = ticket.Find("Job/InkCoverage");
    if (!names || !shares || !names->IsList() || !shares->IsList())
        return;
    auto const& inks = std::get<comgui::List>(*names);
    for (comgui::Element const& share : std::get<comgui::List>(*shares))
    {
        auto const ink = std::ranges::find(inks, share.pos, &comgui::Element::pos);
        auto const* const name = ink == inks.end() ? nullptr : std::get_if<std::string>(&ink->value);
        auto const* const part = std::get_if<double>(&share.value);
        if (name && part)
            Set(std::string(Prefix) + *name + "/Coverage", *part * 100);
    }
}

void InkCoverage::Set(std::string_view key, comgui::Value const& value)
{
    auto const ink = InkKeyOf(key);
    if (!ink)
        return;
    auto const coverage = ink->isCoverage ? CoverageOf(value) : std::nullopt;
    auto const colour = ink->isCoverage ? std::nullopt : ColourOf(value);
    auto found = m_parts.find(ink->name);
    if (found == m_parts.end())
    {
        if ((!coverage && !colour) || m_parts.size() >= GreatestCount)
            return;
        found = m_parts.emplace(ink->name, PARTS()).first;
    }
    PARTS& parts = found->second;
    if (ink->isCoverage)
        parts.coverage = coverage;
    else
        parts.colour = colour;
    if (!parts.coverage && !parts.colour)
        m_parts.erase(found);
}

void InkCoverage::Arrange()
{
    m_inks.clear();
    for (auto const& [name, parts] : m_parts)
    {
        std::size_t const place = PlaceOf(name);
        Rgb const own = place < ProcessInks.size() ? ProcessInks[place].colour : UnknownColour;
        if (parts.coverage)
            m_inks.push_back({name, *parts.coverage, parts.colour.value_or(own)});
    }
    std::ranges::stable_sort(m_inks, {}, [](Ink const& ink) { return PlaceOf(ink.name); });
}

double InkCoverage::Total() const
{
    return std::accumulate(m_inks.begin(), m_inks.end(), 0.0,
                           [](double sum, Ink const& ink) { return sum + ink.coverage; });
}
}  // namespace desk
