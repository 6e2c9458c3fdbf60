#include "standin/server/store/postgres/Bell.h"

#include <algorithm>
#include <charconv>
#include <poll.h>

namespace standin::postgres
{
namespace
{
using namespace std::chrono_literals;

constexpr std::chrono::milliseconds RingDistance = 2ms;  // a ring costs as much as a small change

// The server is asked so long after its last answer, lost if it is silent for so long, and the connection is
// given up later, since it may go on.
constexpr std::chrono::milliseconds QuestionDistance = 1s;
constexpr std::chrono::milliseconds Silence = 2s;

// A server that refuses connections while it starts again need not be noticed.
constexpr std::chrono::milliseconds Patience = 300ms;
}  // namespace

Bell::Bell(Target target, Limits const& limits, Calls calls, Reach& reach, Hurry& hurry)
    : m_target(std::move(target)), m_limits(limits), m_calls(std::move(calls)), m_reach(reach), m_hurry(hurry)
{
    Listen(m_limits.connect);
    m_thread = std::thread([this] { Run(); });
}

Bell::~Bell()
{
    m_isOver = true;
    m_hurry.Begin();
    m_wakeup.Wake();
    if (m_thread.joinable())
        m_thread.join();
}

void Bell::Ring(Sequence newest) noexcept
{
    Sequence known = m_toRing;
    while (known < newest && !m_toRing.compare_exchange_weak(known, newest))
        ;
    if (known < newest && !m_isAsked.exchange(true))
        m_wakeup.Wake();
}

void Bell::Abandon() noexcept
{
    if (m_connection)
        m_connection->Abandon();
    m_thread.detach();
}

// A ring must not wait for the disk: nothing is lost with it.
void Bell::Listen(std::chrono::milliseconds limit)
{
    m_connection = std::make_unique<Connection>(m_target, m_limits.statement, Clock::now() + limit, &m_hurry);
    m_calls.check(*m_connection);
    m_connection->Execute("SET synchronous_commit = off; LISTEN " + m_connection->Quoted(m_target.schema),
                          Clock::now() + limit);
    m_connection->OnSilence(Silence,
                            [this]
                            {
                                m_reach.NoteLoss(m_connection->Name() + ": the server does not answer; " +
                                                 "check the server and the network");
                                m_calls.look();
                            });
    m_lastAnswer = Clock::now();
}

void Bell::Run() noexcept
{
    while (!m_isOver && !m_reach.IsOver())
    {
        try
        {
            if (!m_connection)
                ListenAgain();
            m_pause.Reset();
            m_brokenSince.reset();
            Serve();
        }
        catch (std::exception const& failure)
        {
            NoteBreak(failure);
            PauseAfterBreak();
        }
    }
    m_connection.reset();
}

void Bell::ListenAgain()
{
    Listen(m_reach.IsThere() ? std::min(m_limits.connect, Silence) : m_limits.connect);
    LookAtJournal();
    m_reach.NoteReturn();
    m_calls.look();
}

// It goes on until it can listen again. A server that refuses this connection alone is there.
void Bell::NoteBreak(std::exception const& failure)
{
    m_connection.reset();
    m_brokenSince = m_brokenSince.value_or(Clock::now());
    if (m_toRing > m_rung)
        m_isAsked = true;
    auto const* const broken = dynamic_cast<BrokenConnection const*>(&failure);
    if (broken == nullptr || broken->IsRefusal())
        m_reach.NoteAnswer();
    else if (Clock::now() - *m_brokenSince > Patience)
        m_reach.NoteLoss(failure.what());
}

void Bell::PauseAfterBreak()
{
    for (auto const end = Clock::now() + m_pause.Take();
         !m_isOver && !m_reach.IsOver() && Clock::now() < end;)
        Hear(end);
    m_calls.look();
}

void Bell::Serve()
{
    while (!m_isOver && !m_reach.IsOver())
    {
        auto const now = Clock::now();
        auto const nextRing = m_isAsked ? std::max(m_nextRing, m_pace.Next()) : Clock::time_point::max();
        if (now >= nextRing)
            SendRing();
        else if (now >= m_lastAnswer + QuestionDistance)
            Ask("SELECT", {});
        else if (now >= m_nextLook)
        {
            m_calls.look();
            m_nextLook = now + m_limits.pulse;
        }
        else
            Hear(std::min({nextRing, m_lastAnswer + QuestionDistance, m_nextLook}));
    }
    if (!m_reach.IsOver())
        SendRing();
}

void Bell::Ask(char const* sql, Parameters const& parameters)
{
    m_connection->Run(sql, parameters, Clock::now() + m_limits.connect);
    NoteAnswer();
    HearRings();
}

// Whatever was asked: where changes come all the time, nothing but the journal is asked for.
void Bell::NoteAnswer()
{
    m_lastAnswer = Clock::now();
    bool const wasLost = !m_reach.IsThere();
    m_reach.NoteAnswer();
    if (wasLost)
        m_calls.look();
}

// Until something has happened or the time is over.
void Bell::Hear(Clock::time_point end)
{
    auto const left = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now());
    pollfd waiting[] = {{m_wakeup.Number(), POLLIN, 0},
                        {m_connection ? m_connection->Socket() : -1, POLLIN, 0}};
    poll(waiting, 2, static_cast<int>(std::max<std::int64_t>(left.count(), 0)));
    m_wakeup.Clear();
    if (waiting[1].revents != 0)
    {
        m_connection->TakeIn();
        HearRings();
    }
}

// What is rung and is not in the journal is nobody's change: it counts for nothing.
void Bell::HearRings()
{
    for (Sequence rung = NewestRing(); rung != 0; rung = NewestRing())
    {
        if (rung > std::max<Sequence>(m_known, m_toRing))
            LookAtJournal();
        if (rung <= std::max<Sequence>(m_known, m_toRing))
            m_rung = std::max(m_rung, rung);
    }
}

// Of those that have come; 0 if none has.
Sequence Bell::NewestRing()
{
    Sequence newest = 0;
    for (std::string payload; m_connection->TakeNotification(payload);)
    {
        m_pace.NoteRing();
        Sequence rung = 0;
        auto const parsed = std::from_chars(payload.data(), payload.data() + payload.size(), rung);
        if (parsed.ec == std::errc() && parsed.ptr == payload.data() + payload.size())
            newest = std::max(newest, rung);
    }
    return newest;
}

void Bell::LookAtJournal()
{
    m_known =
        m_connection->Run("SELECT sequence FROM newest", {}, Clock::now() + m_limits.statement).Number(0, 0);
    NoteAnswer();
    m_calls.heard(m_known);
}

void Bell::SendRing()
{
    m_isAsked = false;  // before the look: who raises the number after it asks anew
    Sequence const newest = m_toRing;
    if (newest <= m_rung)
        return;
    m_nextRing = Clock::now() + RingDistance;
    std::string const payload = std::to_string(newest);
    Ask("SELECT pg_notify(convert_from($1, 'UTF8'), convert_from($2, 'UTF8'))",
        Parameters() << std::string_view(m_target.schema) << std::string_view(payload));
    m_rung = newest;
}
}  // namespace standin::postgres
