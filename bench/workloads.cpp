#include "bench/workloads.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>
#include <random>
#include <utility>

namespace
{
// The engine is the same everywhere; the distributions of the standard library are not.
class DICE
{
public:
    explicit DICE(std::uint64_t seed) : engine(seed) {}

    int Below(int limit) { return static_cast<int>(engine() % static_cast<std::uint64_t>(limit)); }

    // From 0 to below 1, with all bits of a double in use.
    double Fraction() { return static_cast<double>(engine() >> 11) * 0x1p-53; }

    template <std::size_t Count>
    char const* OneOf(std::array<char const*, Count> const& choices)
    {
        return choices[engine() % Count];
    }

private:
    std::mt19937_64 engine;
};

template <typename... Arguments>
std::string Format(char const* format, Arguments... arguments)
{
    char text[200];
    return {text, static_cast<std::size_t>(std::snprintf(text, sizeof text, format, arguments...))};
}

constexpr std::array JobSections{"Job",
                                 "Job/Accounting",
                                 "Job/Color",
                                 "Job/Color/Input",
                                 "Job/Color/Output",
                                 "Job/Color/Spot",
                                 "Job/Finishing",
                                 "Job/Finishing/Fold",
                                 "Job/Finishing/Punch",
                                 "Job/Finishing/Staple",
                                 "Job/Imposition",
                                 "Job/Imposition/Marks",
                                 "Job/Layout",
                                 "Job/Media",
                                 "Job/Media/Cover",
                                 "Job/Media/Tray",
                                 "Job/Output",
                                 "Job/Preflight",
                                 "Job/Raster",
                                 "Job/Screening"};

constexpr std::array JobNames{"Active",  "Angle",  "Channels", "Copies", "Count", "Curve", "Description",
                              "Enabled", "Height", "Intent",   "Limit",  "Mode",  "Name",  "Offset",
                              "Profile", "Scale",  "Source",   "Stamp",  "Tray",  "Width"};

constexpr std::array Texts{
    "A4",   "Coated 135 g/m2", "Relative Colorimetric", "default",
    "none", "Top Left",        "Saddle Stitch",         "ISO Coated v2 (ECI)",
    "CMYK", "Müller GmbH",     "$(JOBS)/Hot",           "Annual report 2026, second proof"};

constexpr std::array PaperSizes{210.0, 297.0, 420.0, 105.5, 148.25, 594.0};

void AddVector(WORKLOAD& ticket, char const* key, DICE& dice, bool fractions)
{
    int const size = 3 + dice.Below(14);
    for (int i = 0; i < size; ++i)
        if (fractions)
            ticket.Add(key, dice.Fraction(), i);
        else
            ticket.Add(key, dice.Below(256), i);
}

// What a name means decides the type of its values, as it does in a ticket.
void AddJobValue(WORKLOAD& ticket, char const* key, std::string_view name, DICE& dice)
{
    if (name == "Active" || name == "Enabled")
        ticket.Add(key, dice.Below(2));
    else if (name == "Angle" || name == "Offset")
        ticket.Add(key, dice.Below(2) ? dice.Below(360) * 0.5 - 90 : dice.Fraction());
    else if (name == "Height" || name == "Width")
        ticket.Add(key, PaperSizes[static_cast<std::size_t>(dice.Below(6))]);
    else if (name == "Scale")
        ticket.Add(key, dice.Below(200) / 100.0);
    else if (name == "Channels" && dice.Below(3) == 0)
        AddVector(ticket, key, dice, false);
    else if (name == "Curve" && dice.Below(2))
        AddVector(ticket, key, dice, true);
    else if (name == "Count")
        ticket.Add(key, static_cast<unsigned int>(dice.Below(5000)));
    else if (name == "Stamp")
        ticket.Add(key, 1773000000000LL + dice.Below(1000000000));
    else if (name == "Profile" && dice.Below(4) == 0)
        ticket.AddBytes(key, std::string(static_cast<std::size_t>(16 + dice.Below(48)), '\x9D'));
    else if (name == "Channels" || name == "Copies" || name == "Mode" || name == "Tray")
        ticket.Add(key, dice.Below(12));
    else if (name == "Limit")
        ticket.Add(key, dice.Below(100000) - 1);
    else
        ticket.AddText(key, dice.OneOf(Texts));
}

WORKLOAD MakeJobTicket()
{
    DICE dice(400);
    std::vector<std::pair<std::string, char const*>> keys;
    for (char const* const section : JobSections)
        for (char const* const name : JobNames)
            keys.emplace_back(Format("%s/%s", section, name), name);
    std::sort(keys.begin(), keys.end());
    WORKLOAD ticket;
    for (auto const& [key, name] : keys)
        AddJobValue(ticket, ticket.Key(key), name, dice);
    return ticket;
}

WORKLOAD MakeBigVector()
{
    constexpr int Values = 100000;
    DICE dice(100000);
    WORKLOAD ticket;
    char const* const measured = ticket.Key("System/Calibration/Measured");
    for (int i = 0; i < Values; ++i)
        ticket.Add(measured, dice.Fraction(), i);
    char const* const steps = ticket.Key("System/Calibration/Steps");
    for (int i = 0; i < Values; ++i)
        ticket.Add(steps, dice.Below(65536), i);
    return ticket;
}

constexpr int Printers = 10;

constexpr std::array SystemSections{"Calibration/Curve/Black",
                                    "Calibration/Curve/Cyan",
                                    "Calibration/Curve/Magenta",
                                    "Calibration/Curve/Yellow",
                                    "Calibration/Target/Black",
                                    "Calibration/Target/Cyan",
                                    "Calibration/Target/Magenta",
                                    "Calibration/Target/Yellow",
                                    "Media/Tray_1",
                                    "Media/Tray_2",
                                    "Media/Tray_3",
                                    "Media/Tray_4",
                                    "Media/Tray_5",
                                    "Media/Tray_6",
                                    "Media/Tray_7",
                                    "Media/Tray_8",
                                    "Queue/Direct",
                                    "Queue/Hold",
                                    "Queue/Print",
                                    "Queue/Proof"};

constexpr std::array SystemNames{"Author",   "Changed", "Comment",     "Condition", "Created",
                                 "Density",  "Folder",  "Identifier",  "Limit",     "Name",
                                 "Operator", "Origin",  "Description", "State",     "Weight"};

constexpr std::array Persons{"admin", "operator", "prepress", "M. Keller", "service", "Nightshift"};

void AddSystemValue(WORKLOAD& ticket, char const* key, std::string_view name, int printer, DICE& dice)
{
    if (name == "Density")
        ticket.Add(key, dice.Below(400) / 100.0);
    else if (name == "Limit" || name == "Weight")
        ticket.Add(key, dice.Below(400));
    else if (name == "Author" || name == "Operator")
        ticket.AddText(key, dice.OneOf(Persons));
    else if (name == "Changed" || name == "Created")
        ticket.AddText(key, Format("2026-%02d-%02dT%02d:%02d:%02d", 1 + dice.Below(12), 1 + dice.Below(28),
                                   dice.Below(24), dice.Below(60), dice.Below(60)));
    else if (name == "Folder")
        ticket.AddText(key, Format("$(JOBS)/Printer_%02d/%d", printer, dice.Below(100)));
    else if (name == "Identifier")
        ticket.AddText(key, Format("%08x-%04x", dice.Below(0x7FFFFFFF), dice.Below(0x10000)));
    else if (name == "Comment" && dice.Below(2))
        ticket.AddText(key, "");
    else
        ticket.AddText(key, dice.OneOf(Texts));
}

WORKLOAD MakeSystemTicket()
{
    DICE dice(3000);
    std::vector<std::pair<std::string, char const*>> keys;
    WORKLOAD ticket;
    for (int printer = 0; printer < Printers; ++printer)
    {
        keys.clear();
        for (char const* const section : SystemSections)
            for (char const* const name : SystemNames)
                keys.emplace_back(Format("System/Devices/Printer_%02d/%s/%s", printer, section, name), name);
        std::sort(keys.begin(), keys.end());
        for (auto const& [key, name] : keys)
            AddSystemValue(ticket, ticket.Key(key), name, printer, dice);
    }
    return ticket;
}

long double NumberOf(SETMULTIPAR const& record)
{
    switch (record.type)
    {
    case PARAM_INT:
        return ValueOf<int>(record);
    case PARAM_UNSIGNED:
        return ValueOf<unsigned int>(record);
    case PARAM_INT64:
        return static_cast<long double>(ValueOf<long long>(record));
    case PARAM_DOUBLE:
        return ValueOf<double>(record);
    default:
        return -1;  // never asked for
    }
}

bool IsNumber(PARAM_TYPE type)
{
    return type == PARAM_INT || type == PARAM_UNSIGNED || type == PARAM_INT64 || type == PARAM_DOUBLE;
}
}  // namespace

WORKLOAD::WORKLOAD() : table(1) {}

char const* WORKLOAD::Key(std::string key) { return texts.emplace_back(std::move(key)).c_str(); }

void WORKLOAD::AddRecord(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    table.back() = {key, type, 0, value, pos, false, {}};
    table.push_back({});
}

void WORKLOAD::Add(char const* key, int value, int pos)
{
    AddRecord(key, PARAM_INT, &ints.emplace_back(value), pos);
}

void WORKLOAD::Add(char const* key, unsigned int value, int pos)
{
    AddRecord(key, PARAM_UNSIGNED, &unsigneds.emplace_back(value), pos);
}

void WORKLOAD::Add(char const* key, long long value, int pos)
{
    AddRecord(key, PARAM_INT64, &int64s.emplace_back(value), pos);
}

void WORKLOAD::Add(char const* key, double value, int pos)
{
    AddRecord(key, PARAM_DOUBLE, &doubles.emplace_back(value), pos);
}

void WORKLOAD::AddText(char const* key, std::string text)
{
    AddRecord(key, PARAM_STRING, texts.emplace_back(std::move(text)).c_str(), -1);
}

void WORKLOAD::AddBytes(char const* key, std::string bytes)
{
    AddRecord(key, PARAM_BINSTRING, &views.emplace_back(texts.emplace_back(std::move(bytes))), -1);
}

WORKLOAD& JobTicket()
{
    static WORKLOAD ticket = MakeJobTicket();
    return ticket;
}

WORKLOAD& BigVector()
{
    static WORKLOAD ticket = MakeBigVector();
    return ticket;
}

WORKLOAD& SystemTicket()
{
    static WORKLOAD ticket = MakeSystemTicket();
    return ticket;
}

void COMPARISON::Take(std::string_view key, int pos, bool sameValue)
{
    if (!equal || !next->key || key != next->key || pos != next->pos || !sameValue)
        equal = false;
    else
        ++next;
}

void COMPARISON::Number(std::string_view key, int pos, long double value)
{
    Take(key, pos, IsNumber(next->type) && NumberOf(*next) == value);
}

void COMPARISON::Text(std::string_view key, int pos, std::string_view text)
{
    Take(key, pos, next->type == PARAM_STRING && TextOf(*next) == text);
}

void COMPARISON::Bytes(std::string_view key, int pos, std::string_view bytes)
{
    Take(key, pos, next->type == PARAM_BINSTRING && BytesOf(*next) == bytes);
}
