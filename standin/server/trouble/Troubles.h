// The rules by which a server misbehaves at this moment, and what they make of what happens. There are none
// unless somebody has put them into the system ticket. For any thread; nothing here waits.
#pragma once

#include "standin/server/trouble/TroubleRule.h"
#include <atomic>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace standin
{
// Of the system ticket: a string with a rule a line.
inline constexpr char TroubleKey[] = "System/Trouble";

class Troubles
{
public:
    static constexpr int AwayCode = 106;  // what entries answer then: the site is not available

    struct Verdict
    {
        TroubleRule::Duration delay{};  // before anything else
        int code = 0;                   // 0: the call is carried out
    };
    struct Telling
    {
        TroubleRule::Duration late{};
        bool isTwice = false;
        bool isLost = false;
        bool isSwapped = false;
    };
    struct Standstill
    {
        TroubleRule::Duration by{};
        double at = 100;  // percent of the file
    };

    Troubles() = default;
    Troubles(Troubles const&) = delete;
    Troubles& operator=(Troubles const&) = delete;

    // For a server without any.
    static Troubles& None();

    // These rules from now on, a line each. One that was there before goes on counting; one that is none is
    // left out. The next call tells of it on stderr: nobody may be kept waiting here.
    void Set(std::string_view rules);

    // Those of the beginning, unless newer ones have been set already.
    void Begin(std::string_view rules);

    // None from now on, whoever sets them: for a server that serves no clients.
    void Ignore();

    // Whether there are any, or have been by which sessions were lost. Costs next to nothing.
    bool Any() const noexcept { return m_any.load(std::memory_order_relaxed); }

    Verdict OnCall(Occasion const& call);
    Telling OnNotification(Occasion const& notification);
    Standstill OnTransfer();
    bool IsAway();
    bool IsDiskFull();

    // Numbers of sessions rise. Those that were open when the server went have ended.
    void NoteSession(unsigned long long number) noexcept;
    bool HasLost(unsigned long long session) const noexcept
    {
        return session <= m_lostUpTo.load(std::memory_order_relaxed);
    }

private:
    struct Counted
    {
        TroubleRule rule;
        std::string text;
        unsigned long long occasions = 0;
        unsigned long long strikes = 0;

        bool Strikes(Occasion const& occasion);
    };
    void Take(std::string_view rules);
    std::optional<TroubleRule> RuleOf(std::string const& line);
    void TellOfFaults();
    // Calls use with every rule of the kind that strikes.
    template <typename Use>
    void ForEach(TroubleRule::Kind kind, Occasion const& occasion, Use const& use);
    bool Has(TroubleRule::Kind kind);

    std::atomic<bool> m_any{false};
    std::atomic<unsigned long long> m_newestSession{0};
    std::atomic<unsigned long long> m_lostUpTo{0};
    std::mutex m_lock;  // taken last; the members below
    bool m_isSet = false;
    bool m_isIgnored = false;
    std::vector<std::string> m_faults;  // to be told
    std::vector<Counted> m_rules;
};
}  // namespace standin
