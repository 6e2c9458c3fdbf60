// Random calls in random order from two threads: entries and slots with handles that are good, stale and made
// up, with null pointers where a host can pass them, and with sessions that end meanwhile.
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tests/module_kit/FakePlugIn.h"
#include <bit>
#include <random>
#include <thread>

namespace
{
// What both threads have seen: handles and tables, to be used by either.
class SHARED
{
public:
    void Add(void* hSession, MTICKET_ACCESS const* container)
    {
        std::lock_guard const lock(m_lock);
        m_sessions.push_back(hSession);
        if (container)
            m_containers.push_back(container);
    }
    void Add(STICKET_ACCESS const* ticket)
    {
        std::lock_guard const lock(m_lock);
        if (ticket)
            m_tickets.push_back(ticket);
    }

    void* Session(unsigned number) const { return Pick(m_sessions, number); }
    MTICKET_ACCESS const* Container(unsigned number) const { return Pick(m_containers, number); }
    STICKET_ACCESS const* Ticket(unsigned number) const { return Pick(m_tickets, number); }

private:
    template <typename T>
    T Pick(std::vector<T> const& all, unsigned number) const
    {
        std::lock_guard const lock(m_lock);
        return all.empty() ? nullptr : all[all.size() - 1 - number % std::min<std::size_t>(all.size(), 8)];
    }

    mutable std::mutex m_lock;
    std::vector<void*> m_sessions;
    std::vector<MTICKET_ACCESS const*> m_containers;
    std::vector<STICKET_ACCESS const*> m_tickets;
};

class CALLER
{
public:
    CALLER(ComGUIModuleInterface& table, void* hInstance, SHARED& shared, unsigned seed)
        : m_table(table), m_hInstance(hInstance), m_shared(shared), m_random(seed)
    {
    }
    ~CALLER()
    {
        for (STICKET_ACCESS const* local : m_locals)
            m_table.STicketFactory->DestroyTicket(&local);
    }
    CALLER(CALLER const&) = delete;
    CALLER& operator=(CALLER const&) = delete;

    void Run(int calls)
    {
        for (int i = 0; i < calls; ++i)
            Call(Number(20));
        EXPECT_EQ(m_wrong, 0);
    }

private:
    unsigned Number(unsigned end) { return static_cast<unsigned>(m_random() % end); }
    bool Rarely() { return Number(10) == 0; }

    // Mostly the handle, else one that was made up.
    void* Handle(void* good)
    {
        if (!Rarely())
            return good;
        return std::bit_cast<void*>(static_cast<std::uintptr_t>(m_random() >> Number(64)));
    }
    char const* Key()
    {
        static constexpr char const* Keys[] = {"A", "B", "Job/Name", "", nullptr};
        return Keys[Number(5)];
    }
    int Pos() { return static_cast<int>(Number(7)) - 4; }
    PARAM_TYPE Type() { return static_cast<PARAM_TYPE>(static_cast<int>(Number(12)) - 1); }
    int Id() { return static_cast<int>(Number(6)) - 4 + (Rarely() ? 1 << 24 : 0); }

    // Room for any value that is read.
    void* Place() { return Rarely() ? nullptr : &m_place; }

    // A word that can be followed as the type says.
    void const* Word(PARAM_TYPE type)
    {
        if (Rarely())
            return nullptr;
        if (type == PARAM_STRING)
            return "some text";
        m_bytes = BIN_STRING("bytes", Number(5));
        return type == PARAM_BINSTRING ? static_cast<void const*>(&m_bytes) : &m_number;
    }

    void Call(unsigned which)
    {
        void* const session = Handle(m_shared.Session(Number(8)));
        switch (which)
        {
        case 0:
            return LogIn();
        case 1:
            if (Rarely())
                Expect(m_table.LogoutEntry(Handle(m_hInstance), session));
            return;
        case 2:
            m_table.GetClientContainerEntry(Handle(m_hInstance), session);
            return;
        case 3:
            return Command(session);
        case 4:
            return Local();
        case 5:
        case 6:
        case 7:
        case 8:
        case 9:
        case 10:
            if (auto const* const container = m_shared.Container(Number(8)))
                Use(*container);
            return;
        default:
            if (auto const* const ticket = m_shared.Ticket(Number(8)))
                Use(*ticket);
        }
    }

    void LogIn()
    {
        RECORD record("ada", Rarely() ? "wrong" : fake::Password);
        void* const instance = Handle(m_hInstance);
        int const code = m_table.LoginEntry(instance, Rarely() ? nullptr : &record);
        Expect(code);
        if (code == 0)
            m_shared.Add(record.hSession, m_table.GetClientContainerEntry(m_hInstance, record.hSession));
    }

    void Command(void* session)
    {
        static constexpr char const* Names[] = {"known", "unknown", "local.set.previewfolder",
                                                "remote.job.prepare", nullptr};
        char text[] = "text";
        char* const first = Rarely() ? nullptr : text;
        Expect(m_table.SendCommandEntry(Handle(m_hInstance), session, Names[Number(5)],
                                        static_cast<int>(Number(4)), first));
        Expect(m_table.PutFileEntry(m_hInstance, session, first, text));
        Expect(m_table.GetFileSyncEntry(m_hInstance, session, text, first));
        Expect(m_table.SendJobEntry(m_hInstance, session, nullptr, first, text));
        Expect(m_table.GetTicketDataEntry(m_hInstance, session, Id(), Id(), 0, nullptr, nullptr));
    }

    // Tickets of this thread: one of these is for one thread at a time.
    void Local()
    {
        if (m_locals.size() < 5)
            if (auto const* const made = m_table.STicketFactory->CreateTicket(nullptr))
                m_locals.push_back(made);
        if (m_locals.empty())
            return;
        Use(*m_locals[Number(static_cast<unsigned>(m_locals.size()))]);
        if (Rarely())
        {
            m_table.STicketFactory->DestroyTicket(&m_locals.back());
            m_locals.pop_back();
        }
    }

    static bool OverTickets(void*, int, int id, STICKET_ACCESS const* ticket)
    {
        int read = 0;
        ticket->SGETPARAMETER(ticket->Instance, "A", PARAM_INT, &read, -1);
        return id < 3;
    }
    static bool OverParameters(void*, char const* key, PARAM_TYPE, void const*, int) { return *key != 'B'; }

    void Use(MTICKET_ACCESS const& container)
    {
        void* const i = Handle(container.Instance);
        PARAM_TYPE const type = Type();
        int value = 0;
        GETMULTIPAR reads[] = {{Key(), type, 0, Place(), Pos(), false, {}}, {}};
        SETMULTIPAR writes[] = {{Key(), type, 0, Word(type), Pos(), false, {}}, {}};
        char const* const keys[] = {"A", nullptr};
        bool flag = false;
        STICKET_ACCESS const* opened = nullptr;
        switch (Number(10))
        {
        case 0:
            return Expect(container.MGETPARAMETER(i, 3, Id(), Key(), type, Place(), Pos()));
        case 1:
            return Expect(container.MGETMULTIPAR(i, 3, Id(), Rarely() ? nullptr : reads));
        case 2:
            return Expect(container.MSETPARAMETER(i, 3, Id(), Key(), type, Word(type), Pos()));
        case 3:
            return Expect(container.MSETMULTIPAR(i, 3, Id(), Rarely() ? nullptr : writes));
        case 4:
            if (container.MOPERATION(i, 3, Id(), MTICKET_OP_OPEN, &opened))
                m_shared.Add(opened);
            return;
        case 5:
            return Expect(container.MOPERATION(i, 3, Id(), MTICKET_OP_CLOSE, &flag));
        case 6:
            return Expect(container.MOPERATION(
                i, 3, Rarely() ? 1 : -4, Rarely() ? MTICKET_OP_DELETE : MTICKET_OP_CREATE_NEXT, &value));
        case 7:
            m_shared.Add(container.MCREATETICKET(i, 3, Id(), Rarely() ? nullptr : keys));
            return;
        case 8:
            return Expect(container.MENDISNOTIF(i, 3, Id(), Id(), Rarely(), Rarely() ? nullptr : keys));
        default:
            return Expect(container.MWALKTICKETS(i, Rarely() ? nullptr : OverTickets, nullptr, 3));
        }
    }

    void Use(STICKET_ACCESS const& ticket)
    {
        void* const i = Handle(ticket.Instance);
        PARAM_TYPE const type = Type();
        GETMULTIPAR reads[] = {{Key(), type, 0, Place(), Pos(), false, {}}, {}};
        SETMULTIPAR writes[] = {{Key(), type, 0, Word(type), Pos(), false, {}}, {}};
        switch (Number(6))
        {
        case 0:
            return Expect(ticket.SGETPARAMETER(i, Key(), type, Place(), Pos()));
        case 1:
            return Expect(ticket.SGETMULTIPAR(i, Rarely() ? nullptr : reads));
        case 2:
            return Expect(ticket.SSETPARAMETER(i, Key(), type, Word(type), Pos()));
        case 3:
            return Expect(ticket.SSETMULTIPAR(i, Rarely() ? nullptr : writes));
        case 4:
            return Expect(ticket.SOPTION(i, static_cast<int>(Number(14)), Place()));
        default:
            return Expect(ticket.SWALKPARAMETERS(i, Rarely() ? nullptr : OverParameters, nullptr,
                                                 Rarely() ? nullptr : "", 8000));
        }
    }

    // Every call answers with a code or a truth value of the kit's or the author's.
    void Expect(int result)
    {
        if (result < 0 || result > 112)
            ++m_wrong;
    }

    ComGUIModuleInterface& m_table;
    void* const m_hInstance;
    SHARED& m_shared;
    std::mt19937_64 m_random;
    std::vector<STICKET_ACCESS const*> m_locals;
    BIN_STRING m_place;
    BIN_STRING m_bytes;
    unsigned long long m_number = 5;
    int m_wrong = 0;
};

using RandomCalls = PlugInTest;
}  // namespace

TEST_F(RandomCalls, OfTwoThreads_DoNoHarm)
{
    constexpr int Calls = 30'000;
    for (unsigned const seed : {1u, 2u, 3u})
    {
        SHARED shared;
        CALLER one(table, hInstance, shared, seed);
        CALLER two(table, hInstance, shared, seed + 100);
        std::thread other([&] { two.Run(Calls); });
        one.Run(Calls);
        other.join();
        EXPECT_NE(shared.Ticket(0), nullptr);  // it came so far
    }
    MTICKET_ACCESS const& container = *ContainerOf(LogIn());
    fake::Address const ticket = NewTicket();
    int const value = 7;
    EXPECT_EQ(container.MSETPARAMETER(container.Instance, 3, ticket.id, "K", PARAM_INT, &value, -1), 1);
}

TEST_F(RandomCalls, WithExceptionsFromEverywhere_DoNoHarm)
{
    std::atomic<unsigned> count = 0;
    fake::Trouble::Set(
        [&](std::string const&)
        {
            unsigned const number = ++count;
            if (number % 7 == 0)
                throw std::runtime_error("random");
            if (number % 11 == 0)
                throw number;
        });
    SHARED shared;
    CALLER one(table, hInstance, shared, 4);
    CALLER two(table, hInstance, shared, 5);
    std::thread other([&] { two.Run(20'000); });
    one.Run(20'000);
    other.join();
    EXPECT_GT(count, 1000u);
    fake::Trouble::Clear();
    EXPECT_NE(ContainerOf(LogIn()), nullptr);
}
