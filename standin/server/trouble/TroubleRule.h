// One way in which a server is to misbehave, as a line of text: what is to happen, and to whom. Words are
// parted by blanks, the first one says what:
//
//   fail     a call is not carried out; code=N is what an entry answers (112)
//   delay    a call takes longer by=DURATION
//   away     as if the server were gone: calls fail, entries answer 106, transfers are cut, and nothing is
//            told. With sessions=lost those that were open have ended when it is back
//   late     notifications come late by=DURATION, in their order
//   twice    notifications come twice
//   lost     notifications do not come
//   swapped  a notification comes behind the next one, or after a second
//   stall    transfers of files and jobs stand still by=DURATION at=PERCENT (50%) of the file
//   full     the server's disk is full: nothing can be written to it
//
// Which of the calls, notifications or transfers: call=NAME, that of an entry, a slot or a command, with *
// and ?; ticket=TYPE/ID or TYPE/*; user=NAME; nth=N, only that one; share=PERCENT, drawn at random with
// seed=N; times=N, no more than so many. They are counted in each program for itself. until=SECONDS since
// 1970 ends a rule, and so does for=DURATION, from when it is read. Whoever asks for what an occasion does
// not have, as the ticket of a login, asks in vain.
//
// A duration is a number with ms, s or m, at most ten minutes.
#pragma once

#include "standin/server/tickets/TicketAddress.h"
#include <chrono>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

namespace standin
{
// what() says what is wrong with the text of a rule, and what would be right.
class TroubleError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

// What may be struck. What something has not stays empty: no rule that asks for it strikes.
struct Occasion
{
    std::string_view call{};
    std::string_view command{};  // of the call SendCommandEntry
    std::optional<TicketAddress> ticket{};
    std::string_view user{};
};

struct TroubleRule
{
    using Clock = std::chrono::system_clock;
    using Duration = std::chrono::milliseconds;

    enum Kind
    {
        Fail,
        Delay,
        Away,
        Late,
        Twice,
        Lost,
        Swapped,
        Stall,
        Full,
    };

    static constexpr int DefaultCode = 112;
    static constexpr Duration LongestDuration = std::chrono::minutes(10);

    // Throws TroubleError.
    static TroubleRule Parse(std::string_view line);

    // In the canonical form, which Parse takes.
    std::string Text() const;

    bool IsFor(Occasion const& occasion) const;
    bool HasEnded(Clock::time_point now) const { return until && now >= *until; }

    // Whether it strikes at the nth occasion that it is for, 1 being the first, but for times.
    bool IsDrawn(unsigned long long nth) const;

    Kind kind = Fail;
    std::string call{};  // empty: any
    std::optional<int> ticketType{};
    std::optional<int> ticketId{};  // nothing: any of the type
    std::string user{};             // empty: any
    std::optional<unsigned long long> nth{};
    std::optional<double> share{};  // percent, above 0 and at most 100
    unsigned long long seed = 0;
    std::optional<unsigned long long> times{};
    int code = DefaultCode;
    Duration by{};   // of Delay, Late and Stall
    double at = 50;  // percent
    bool endsSessions = false;
    std::optional<Clock::time_point> until{};
};
}  // namespace standin
