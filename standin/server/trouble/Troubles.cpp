#include "standin/server/trouble/Troubles.h"

#include "standin/server/files/Report.h"
#include <algorithm>
#include <utility>

namespace standin
{
namespace
{
std::string_view NextLine(std::string_view& text)
{
    std::size_t const size = std::min(text.find('\n'), text.size());
    std::string_view const line = text.substr(0, size);
    text.remove_prefix(std::min(size + 1, text.size()));
    return line;
}
}  // namespace

Troubles& Troubles::None()
{
    static Troubles none;
    return none;
}

void Troubles::Set(std::string_view rules)
{
    std::lock_guard const lock(m_lock);
    m_isSet = true;
    Take(rules);
}

void Troubles::Begin(std::string_view rules)
{
    std::lock_guard const lock(m_lock);
    if (!m_isSet)
        Take(rules);
}

void Troubles::Ignore()
{
    std::lock_guard const lock(m_lock);
    Take("");
    m_isIgnored = true;
}

// Nothing for an empty line, and for one that is no rule.
std::optional<TroubleRule> Troubles::RuleOf(std::string const& line)
{
    if (line.find_first_not_of(" \t") == std::string::npos)
        return std::nullopt;
    try
    {
        return TroubleRule::Parse(line);
    }
    catch (TroubleError const& error)
    {
        m_faults.emplace_back(error.what());
        return std::nullopt;
    }
}

void Troubles::TellOfFaults()
{
    std::vector<std::string> faults;
    {
        std::lock_guard const lock(m_lock);
        faults = std::exchange(m_faults, {});
        m_any = !m_rules.empty() || m_lostUpTo != 0;
    }
    for (std::string const& fault : faults)
        Report({TroubleKey, ": a rule is left out: ", ForMessages(fault)});
}

void Troubles::Take(std::string_view text)
{
    if (m_isIgnored)
        return;
    m_faults.clear();
    std::vector<Counted> rules;
    while (!text.empty())
    {
        std::string const line(NextLine(text));
        auto const before = std::find_if(m_rules.begin(), m_rules.end(),
                                         [&](Counted const& old) { return old.text == line; });
        if (before != m_rules.end())
        {
            rules.push_back(std::move(*before));
            m_rules.erase(before);
        }
        else if (auto rule = RuleOf(line))
        {
            if (rule->endsSessions && !rule->HasEnded(TroubleRule::Clock::now()))
                m_lostUpTo = m_newestSession.load();
            rules.push_back({*std::move(rule), line});
        }
    }
    m_rules = std::move(rules);
    m_any = !m_rules.empty() || m_lostUpTo != 0 || !m_faults.empty();
}

bool Troubles::Counted::Strikes(Occasion const& occasion)
{
    if (!rule.IsFor(occasion) || !rule.IsDrawn(++occasions) || (rule.times && strikes == *rule.times))
        return false;
    ++strikes;
    return true;
}

template <typename Use>
void Troubles::ForEach(TroubleRule::Kind kind, Occasion const& occasion, Use const& use)
{
    auto const now = TroubleRule::Clock::now();
    std::lock_guard const lock(m_lock);
    for (Counted& each : m_rules)
        if (each.rule.kind == kind && !each.rule.HasEnded(now) && each.Strikes(occasion))
            use(each.rule);
}

bool Troubles::Has(TroubleRule::Kind kind)
{
    bool has = false;
    if (Any())
        ForEach(kind, {}, [&](TroubleRule const&) { has = true; });
    return has;
}

bool Troubles::IsAway() { return Has(TroubleRule::Away); }

bool Troubles::IsDiskFull() { return Has(TroubleRule::Full); }

Troubles::Verdict Troubles::OnCall(Occasion const& call)
{
    TellOfFaults();
    Verdict verdict;
    ForEach(TroubleRule::Delay, call, [&](TroubleRule const& rule) { verdict.delay += rule.by; });
    if (IsAway())
        verdict.code = AwayCode;
    else
        ForEach(TroubleRule::Fail, call, [&](TroubleRule const& rule) { verdict.code = rule.code; });
    return verdict;
}

Troubles::Telling Troubles::OnNotification(Occasion const& notification)
{
    Telling telling;
    ForEach(TroubleRule::Late, notification, [&](TroubleRule const& rule) { telling.late += rule.by; });
    ForEach(TroubleRule::Twice, notification, [&](TroubleRule const&) { telling.isTwice = true; });
    ForEach(TroubleRule::Lost, notification, [&](TroubleRule const&) { telling.isLost = true; });
    ForEach(TroubleRule::Swapped, notification, [&](TroubleRule const&) { telling.isSwapped = true; });
    telling.isLost = telling.isLost || IsAway();
    return telling;
}

Troubles::Standstill Troubles::OnTransfer()
{
    Standstill standstill;
    if (Any())
        ForEach(TroubleRule::Stall, {},
                [&](TroubleRule const& rule)
                {
                    if (standstill.by.count() == 0)
                        standstill = {rule.by, rule.at};
                });
    return standstill;
}

void Troubles::NoteSession(unsigned long long number) noexcept
{
    unsigned long long known = m_newestSession.load();
    while (known < number && !m_newestSession.compare_exchange_weak(known, number))
        ;
}
}  // namespace standin
