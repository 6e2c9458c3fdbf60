#include "standin/server/trouble/TroubleRule.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <fnmatch.h>
#include <iterator>
#include <limits>

namespace standin
{
namespace
{
// Which words a kind takes, besides until.
enum Takes : unsigned
{
    TakesNothing = 0,
    TakesCall = 1,
    TakesTicket = 2,
    TakesUser = 4,
    TakesDraw = 8,  // nth, share, seed and times
    TakesCode = 16,
    TakesBy = 32,
    TakesAt = 64,
    TakesSessions = 128,
};
constexpr unsigned TakesOccasion = TakesCall | TakesTicket | TakesUser | TakesDraw;
constexpr unsigned TakesNotification = TakesTicket | TakesUser | TakesDraw;

struct KindWord
{
    char const* word;
    unsigned takes;
};
constexpr std::array<KindWord, 9> Kinds{{
    {"fail", TakesOccasion | TakesCode},
    {"delay", TakesOccasion | TakesBy},
    {"away", TakesSessions},
    {"late", TakesNotification | TakesBy},
    {"twice", TakesNotification},
    {"lost", TakesNotification},
    {"swapped", TakesNotification},
    {"stall", TakesDraw | TakesBy | TakesAt},
    {"full", TakesNothing},
}};
static_assert(Kinds.size() == TroubleRule::Full + 1);

// Those that can be struck, besides commands.
constexpr char const* Calls[] = {
    "IsAliveEntry",     "InitializeEntry", "LoginEntry",      "GetTicketDataEntry",
    "SendCommandEntry", "PutFileEntry",    "GetFileEntry",    "PutFileSyncEntry",
    "GetFileSyncEntry", "SendJobEntry",    "MGETPARAMETER",   "MGETMULTIPAR",
    "MWALKTICKETS",     "MSETPARAMETER",   "MSETMULTIPAR",    "MOPERATION",
    "MENDISNOTIF",      "MCREATETICKET",   "SGETPARAMETER",   "SGETMULTIPAR",
    "SSETPARAMETER",    "SSETMULTIPAR",    "SWALKPARAMETERS", "SOPTION",
};

bool Matches(std::string const& pattern, std::string_view name)
{
    return fnmatch(pattern.c_str(), std::string(name).c_str(), 0) == 0;
}

[[noreturn]] void Fault(std::string_view word, char const* remedy)
{
    throw TroubleError("\"" + std::string(word) + "\": " + remedy);
}

std::string_view NextWord(std::string_view& line)
{
    line.remove_prefix(std::min(line.find_first_not_of(" \t"), line.size()));
    std::size_t const size = std::min(line.find_first_of(" \t"), line.size());
    std::string_view const word = line.substr(0, size);
    line.remove_prefix(size);
    return word;
}

template <typename Number>
std::optional<Number> NumberOf(std::string_view text)
{
    Number number{};
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    return error == std::errc() && end == text.data() + text.size() ? std::optional(number) : std::nullopt;
}

unsigned long long CountOf(std::string_view word, std::string_view text)
{
    auto const count = NumberOf<unsigned long long>(text);
    if (!count || *count == 0)
        Fault(word, "write a number from 1 on");
    return *count;
}

double PercentOf(std::string_view word, std::string_view text)
{
    bool const hasSign = text.ends_with('%');
    auto const percent = NumberOf<double>(text.substr(0, text.size() - (hasSign ? 1 : 0)));
    if (!hasSign || !percent || !(*percent > 0 && *percent <= 100))
        Fault(word, "write a percentage above 0% and up to 100%");
    return *percent;
}

TroubleRule::Duration DurationOf(std::string_view word, std::string_view text)
{
    std::size_t const digits = std::min(text.find_first_not_of("0123456789"), text.size());
    auto const number = NumberOf<int>(text.substr(0, digits));
    std::string_view const unit = text.substr(digits);
    long long const factor = unit == "ms" ? 1 : unit == "s" ? 1000 : unit == "m" ? 60'000 : 0;
    if (!number || !factor || *number * factor > TroubleRule::LongestDuration.count())
        Fault(word, "write a duration as 250ms, 2s or 1m, at most ten minutes");
    return TroubleRule::Duration(*number * factor);
}

void ReadTicket(std::string_view word, std::string_view text, TroubleRule& rule)
{
    auto const slash = text.find('/');
    auto const type = NumberOf<int>(text.substr(0, slash));
    std::string_view const idText = slash == std::string_view::npos ? "" : text.substr(slash + 1);
    auto const id = NumberOf<int>(idText);
    bool const isWholeType = idText == "*";
    if (!type || (!id && !isWholeType) || !IsValid(TicketAddress{*type, id.value_or(0)}))
        Fault(word, "write ticket=TYPE/ID or ticket=TYPE/*, as in 3/12");
    rule.ticketType = type;
    rule.ticketId = id;
}

// The name of a command has a point in it, and nobody knows them all.
std::string CallOf(std::string_view word, std::string_view text)
{
    std::string pattern(text);
    bool const isKnown = std::any_of(std::begin(Calls), std::end(Calls),
                                     [&](char const* name) { return Matches(pattern, name); });
    if (!isKnown && pattern.find('.') == std::string::npos)
        Fault(word, "no entry, slot or command is called that, as MGETPARAMETER, LoginEntry and "
                    "remote.job.prepare are");
    return pattern;
}

TroubleRule::Clock::time_point TimeOf(std::string_view word, std::string_view text)
{
    constexpr double Latest = 9e9;  // the year 2255; a clock of nanoseconds has no room for much more
    auto const seconds = NumberOf<double>(text);
    if (!seconds || !(*seconds >= 0 && *seconds < Latest))
        Fault(word, "write seconds since 1970");
    return TroubleRule::Clock::time_point(TroubleRule::Duration(std::llround(*seconds * 1000)));
}

// To the millisecond, which is what texts have.
TroubleRule::Clock::time_point EndAfter(std::string_view word, std::string_view text)
{
    auto const now = std::chrono::time_point_cast<TroubleRule::Duration>(TroubleRule::Clock::now());
    return now + DurationOf(word, text);
}

int CodeOf(std::string_view word, std::string_view text)
{
    auto const code = NumberOf<int>(text);
    if (!code || *code == 0)
        Fault(word, "write a code other than 0, which would be success");
    return *code;
}

unsigned long long SeedOf(std::string_view word, std::string_view text)
{
    auto const seed = NumberOf<unsigned long long>(text);
    if (!seed)
        Fault(word, "write a number");
    return *seed;
}

bool IsLost(std::string_view word, std::string_view text)
{
    if (text != "kept" && text != "lost")
        Fault(word, "write sessions=kept or sessions=lost");
    return text == "lost";
}

struct Word
{
    char const* name;
    unsigned neededBy;  // what a kind has to take
    void (*read)(TroubleRule& rule, std::string_view word, std::string_view text);
};
constexpr Word Words[] = {
    {"call", TakesCall, [](auto& rule, auto word, auto text) { rule.call = CallOf(word, text); }},
    {"ticket", TakesTicket, [](auto& rule, auto word, auto text) { ReadTicket(word, text, rule); }},
    {"user", TakesUser, [](auto& rule, auto, auto text) { rule.user = text; }},
    {"code", TakesCode, [](auto& rule, auto word, auto text) { rule.code = CodeOf(word, text); }},
    {"by", TakesBy, [](auto& rule, auto word, auto text) { rule.by = DurationOf(word, text); }},
    {"at", TakesAt, [](auto& rule, auto word, auto text) { rule.at = PercentOf(word, text); }},
    {"sessions", TakesSessions,
     [](auto& rule, auto word, auto text) { rule.endsSessions = IsLost(word, text); }},
    {"nth", TakesDraw, [](auto& rule, auto word, auto text) { rule.nth = CountOf(word, text); }},
    {"share", TakesDraw, [](auto& rule, auto word, auto text) { rule.share = PercentOf(word, text); }},
    {"seed", TakesDraw, [](auto& rule, auto word, auto text) { rule.seed = SeedOf(word, text); }},
    {"times", TakesDraw, [](auto& rule, auto word, auto text) { rule.times = CountOf(word, text); }},
    {"for", TakesNothing, [](auto& rule, auto word, auto text) { rule.until = EndAfter(word, text); }},
    {"until", TakesNothing, [](auto& rule, auto word, auto text) { rule.until = TimeOf(word, text); }},
};

TroubleRule::Kind KindOf(std::string_view word)
{
    for (std::size_t i = 0; i < Kinds.size(); ++i)
        if (word == Kinds[i].word)
            return static_cast<TroubleRule::Kind>(i);
    Fault(word, "begin with fail, delay, away, late, twice, lost, swapped, stall or full");
}

void ReadWord(std::string_view word, TroubleRule& rule)
{
    std::size_t const equals = word.find('=');
    std::string_view const name = word.substr(0, equals);
    std::string_view const text = equals == std::string_view::npos ? "" : word.substr(equals + 1);
    unsigned const takes = Kinds[rule.kind].takes;
    for (Word const& known : Words)
        if (name == known.name && (takes & known.neededBy) == known.neededBy)
        {
            if (text.empty())
                Fault(word, "write what it is to be behind the equals sign");
            return known.read(rule, word, text);
        }
    std::string remedy = std::string(Kinds[rule.kind].word) + " takes ";
    for (Word const& known : Words)
        if ((takes & known.neededBy) == known.neededBy)
            remedy += std::string(known.name) + "=, ";
    Fault(word, remedy.substr(0, remedy.size() - 2).c_str());
}

// splitmix64: one well mixed number for each count.
unsigned long long Mixed(unsigned long long seed, unsigned long long nth)
{
    unsigned long long word = seed + nth * 0x9E3779B97F4A7C15ULL;
    word = (word ^ (word >> 30)) * 0xBF58476D1CE4E5B9ULL;
    word = (word ^ (word >> 27)) * 0x94D049BB133111EBULL;
    return word ^ (word >> 31);
}

std::string ShortText(double number)
{
    char text[32];
    auto const end = std::to_chars(text, std::end(text), number).ptr;
    return {text, end};
}
}  // namespace

TroubleRule TroubleRule::Parse(std::string_view line)
{
    auto const isControl = [](char byte) { return static_cast<unsigned char>(byte) < 0x20 && byte != '\t'; };
    if (std::any_of(line.begin(), line.end(), isControl))
        throw TroubleError("a rule is one line without control characters");
    TroubleRule rule;
    rule.kind = KindOf(NextWord(line));
    for (std::string_view word = NextWord(line); !word.empty(); word = NextWord(line))
        ReadWord(word, rule);
    bool const needsDuration = (Kinds[rule.kind].takes & TakesBy) != 0;
    if (needsDuration && rule.by == Duration{})
        Fault(Kinds[rule.kind].word, "say how long with by=DURATION, as in by=250ms");
    return rule;
}

std::string TroubleRule::Text() const
{
    unsigned const takes = Kinds[kind].takes;
    std::string text = Kinds[kind].word;
    auto const add = [&text](char const* name, std::string const& value)
    { text += std::string(" ") + name + "=" + value; };
    if (!call.empty())
        add("call", call);
    if (ticketType)
        add("ticket", std::to_string(*ticketType) + "/" + (ticketId ? std::to_string(*ticketId) : "*"));
    if (!user.empty())
        add("user", user);
    if (takes & TakesCode && code != DefaultCode)
        add("code", std::to_string(code));
    if (takes & TakesBy)
        add("by", std::to_string(by.count()) + "ms");
    if (takes & TakesAt)
        add("at", ShortText(at) + "%");
    if (takes & TakesSessions)
        add("sessions", endsSessions ? "lost" : "kept");
    if (nth)
        add("nth", std::to_string(*nth));
    if (share)
        add("share", ShortText(*share) + "%");
    if (seed != 0)
        add("seed", std::to_string(seed));
    if (times)
        add("times", std::to_string(*times));
    if (until)
    {
        auto const milliseconds = std::chrono::duration_cast<Duration>(until->time_since_epoch()).count();
        std::string const rest = std::to_string(1000 + milliseconds % 1000).substr(1);
        add("until", std::to_string(milliseconds / 1000) + "." + rest);
    }
    return text;
}

bool TroubleRule::IsFor(Occasion const& occasion) const
{
    bool const isCall = call.empty() || Matches(call, occasion.call) ||
                        (!occasion.command.empty() && Matches(call, occasion.command));
    bool const isTicket = !ticketType || (occasion.ticket && occasion.ticket->type == *ticketType &&
                                          (!ticketId || occasion.ticket->id == *ticketId));
    return isCall && isTicket && (user.empty() || user == occasion.user);
}

bool TroubleRule::IsDrawn(unsigned long long occasion) const
{
    if (nth && occasion != *nth)
        return false;
    constexpr double Whole = 18446744073709551616.0;  // 2 to the 64th
    return !share || static_cast<double>(Mixed(seed, occasion)) < *share / 100 * Whole;
}
}  // namespace standin
