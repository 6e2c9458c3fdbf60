#include "standin/server/store/postgres/Bell.h"

#include <algorithm>
#include <charconv>
#include <fcntl.h>
#include <poll.h>
#include <system_error>
#include <unistd.h>

namespace standin::postgres
{
namespace
{
using namespace std::chrono_literals;

constexpr std::chrono::milliseconds LastRingLimit = 500ms;
constexpr std::chrono::milliseconds Forever = 24h;
constexpr std::chrono::milliseconds RingDistance = 2ms;  // a ring costs as much as a small change
}  // namespace

Bell::Bell(Target target, Limits const& limits, std::function<void(Sequence)> heard)
    : m_target(std::move(target)), m_limits(limits), m_heard(std::move(heard))
{
    int ends[2];
    if (pipe2(ends, O_CLOEXEC | O_NONBLOCK) != 0)
        throw StoreError("cannot make a pipe (" + std::generic_category().message(errno) +
                         "); close some files, then try again");
    m_wokenEnd = Descriptor(ends[0]);
    m_wakingEnd = Descriptor(ends[1]);
    Listen();
    m_thread = std::thread([this] { Run(); });
}

Bell::~Bell()
{
    m_isOver = true;
    Wake();
    if (m_thread.joinable())
        m_thread.join();
}

void Bell::Ring(Sequence newest) noexcept
{
    Sequence known = m_toRing;
    while (known < newest && !m_toRing.compare_exchange_weak(known, newest))
        ;
    if (known < newest && !m_isAsked.exchange(true))
        Wake();
}

void Bell::Abandon() noexcept
{
    if (m_connection)
        m_connection->Abandon();
    m_thread.detach();
}

// A full pipe wakes as well.
void Bell::Wake() noexcept { [[maybe_unused]] ssize_t const ignored = write(m_wakingEnd.Number(), "", 1); }

// A ring must not wait for the disk: nothing is lost with it.
void Bell::Listen()
{
    m_connection =
        std::make_unique<Connection>(m_target, m_limits.statement, Clock::now() + m_limits.connect);
    m_connection->Execute("SET synchronous_commit = off; LISTEN " + m_connection->Quoted(m_target.schema),
                          Clock::now() + m_limits.statement);
}

void Bell::Run() noexcept
{
    GrowingPause pause;
    while (!m_isOver)
    {
        try
        {
            if (!m_connection)
            {
                Listen();
                m_heard(
                    m_connection->Run("SELECT sequence FROM newest", {}, Clock::now() + m_limits.statement)
                        .Number(0, 0));
            }
            pause.Reset();
            Serve();
        }
        catch (std::exception const&)
        {
            // The working connection reports what is wrong; this one goes on until it can listen again.
            m_connection.reset();
            if (m_toRing > m_rung)
                m_isAsked = true;
            for (auto const end = Clock::now() + pause.Take(); !m_isOver && Clock::now() < end;)
                Hear(end);
        }
    }
}

void Bell::Serve()
{
    while (!m_isOver)
    {
        bool const isAsked = m_isAsked;
        if (isAsked && Clock::now() >= m_nextRing)
            SendRing(m_limits.statement);
        else
            Hear(isAsked ? m_nextRing : Clock::now() + Forever);
    }
    SendRing(LastRingLimit);
}

// Until something has happened or the time is over.
void Bell::Hear(Clock::time_point end)
{
    auto const left = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now());
    pollfd waiting[] = {{m_wokenEnd.Number(), POLLIN, 0},
                        {m_connection ? m_connection->Socket() : -1, POLLIN, 0}};
    poll(waiting, 2, static_cast<int>(std::max<std::int64_t>(left.count(), 0)));
    char bytes[64];
    while (read(m_wokenEnd.Number(), bytes, sizeof bytes) > 0)
        ;
    if (waiting[1].revents != 0)
    {
        m_connection->TakeIn();
        HearRings();
    }
}

void Bell::HearRings()
{
    Sequence newest = 0;
    for (std::string payload; m_connection->TakeNotification(payload);)
    {
        Sequence rung = 0;
        auto const parsed = std::from_chars(payload.data(), payload.data() + payload.size(), rung);
        if (parsed.ec == std::errc() && parsed.ptr == payload.data() + payload.size())
            newest = std::max(newest, rung);
    }
    if (newest != 0)
        m_heard(newest);
}

void Bell::SendRing(std::chrono::milliseconds limit)
{
    m_isAsked = false;  // before the look: who raises the number after it asks anew
    Sequence const newest = m_toRing;
    if (newest <= m_rung)
        return;
    m_nextRing = Clock::now() + RingDistance;
    std::string const payload = std::to_string(newest);
    m_connection->Run("SELECT pg_notify(convert_from($1, 'UTF8'), convert_from($2, 'UTF8'))",
                      Parameters() << std::string_view(m_target.schema) << std::string_view(payload),
                      Clock::now() + limit);
    m_rung = newest;
    HearRings();
}
}  // namespace standin::postgres
