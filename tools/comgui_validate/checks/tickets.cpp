// Tickets as a whole, and what they can be asked about themselves.
#include "tools/comgui_validate/Memory.h"
#include "tools/comgui_validate/Opened.h"
#include "tools/comgui_validate/Subject.h"

#include "comgui/ticket/TICKET_ID.h"
#include <algorithm>
#include <climits>
#include <cstring>

namespace validate
{
namespace
{
class Slots
{
public:
    explicit Slots(Session& session) : m_trial(session.GetTrial()), m_table(session.Container()) {}

    int Operate(int type, int id, TICKET_OP op, char const* name, void* argument)
    {
        m_trial.Calling("MOPERATION(" + NameOf(type, id) + ", " + name + ", argument)");
        return m_table->MOPERATION(m_table->Instance, type, id, op, argument);
    }
    STICKET_ACCESS const* Open(int type, int id, int* result = nullptr)
    {
        STICKET_ACCESS const* ticket = nullptr;
        int const answer = Operate(type, id, MTICKET_OP_OPEN, "MTICKET_OP_OPEN", &ticket);
        if (result)
            *result = answer;
        return answer != 0 ? ticket : nullptr;
    }
    int Close(int type, int id)
    {
        bool flag = false;
        return Operate(type, id, MTICKET_OP_CLOSE, "MTICKET_OP_CLOSE", &flag);
    }
    int Delete(int type, int id)
    {
        return Operate(type, id, MTICKET_OP_DELETE, "MTICKET_OP_DELETE", nullptr);
    }
    MTICKET_ACCESS const& Table() const { return *m_table; }
    Trial& GetTrial() const { return m_trial; }

    // Ids of the tickets of that type that a walk gives, as often as it gives them; at most so many calls.
    std::vector<int> Walk(int type, std::size_t most = SIZE_MAX)
    {
        struct Context
        {
            std::vector<int> ids{};
            std::size_t most = 0;
            int type = 0;
            bool isGood = true;
        } context{{}, most, type, true};
        m_trial.Calling("MWALKTICKETS(action, context, " + std::to_string(type) + ")");
        m_table->MWALKTICKETS(
            m_table->Instance,
            [](void* place, int itsType, int id, STICKET_ACCESS const* ticket)
            {
                auto& here = *static_cast<Context*>(place);
                here.isGood = here.isGood && itsType == here.type && ticket && ticket->SGETPARAMETER;
                here.ids.push_back(id);
                return here.ids.size() < here.most;
            },
            &context, type);
        m_trial.Expect("K8", context.isGood, "a ticket of another type, or without a table",
                       "the type, the id and the table of each ticket");
        return context.ids;
    }

private:
    Trial& m_trial;
    MTICKET_ACCESS const* const m_table;
};

// Deletes the tickets at its end.
struct Removed
{
    Slots& slots;
    int type;
    std::vector<int> const& ids;
    ~Removed()
    {
        for (int const id : ids)
            slots.Delete(type, id);
    }
};

void CreateNext(Trial& trial)
{
    Session session(trial);
    ScratchTicket const first(session);
    if (!first.IsOwn())
        throw Skipped("no ticket can be made; name a type with --option ticket-type=N");
    Slots slots(session);
    std::vector<int> made;
    Removed const removed{slots, first.Type(), made};
    for (int i = 0; i < 5; ++i)
    {
        int id = -1;
        trial.ExpectSuccess("K1", slots.Operate(first.Type(), TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT,
                                                "MTICKET_OP_CREATE_NEXT", &id));
        trial.Expect("K1", TICKET_ID_Valid(id), std::to_string(id), "an id from 0 to 16777215");
        bool const isNew = id != first.Id() && std::find(made.begin(), made.end(), id) == made.end();
        trial.Expect("K1", isNew, "the id " + std::to_string(id) + " again", "another ticket");
        made.push_back(id);
        trial.Expect("K1", slots.Open(first.Type(), id), "an id of no ticket", "a ticket that can be opened");
        slots.Close(first.Type(), id);
    }
}

void Open(Trial& trial)
{
    Session session(trial);
    ScratchTicket const ticket(session);
    Slots slots(session);
    STICKET_ACCESS const* const table = slots.Open(ticket.Type(), ticket.Id());
    trial.Expect("K2", table, "null", "the ticket's table");
    {
        InContainer fromOutside(trial, session.Container(), ticket.Type(), ticket.Id());
        WithTable fromInside(trial, table);
        fromOutside.ExpectWrite("V2", Key("Outside"), Int(1));
        fromInside.ExpectValue("K3", Key("Outside"), Int(1));
        fromInside.ExpectWrite("K3", Key("Inside"), Int(2));
        fromOutside.ExpectValue("K3", Key("Inside"), Int(2));
    }
    slots.Close(ticket.Type(), ticket.Id());
}

int MissingId(Slots& slots, int type)
{
    auto const ids = slots.Walk(type);
    for (int id = 16'777'215; id > 0; --id)
        if (std::find(ids.begin(), ids.end(), id) == ids.end())
            return id;
    throw Skipped("every id of the type is a ticket");
}

void OpenMissing(Trial& trial)
{
    Session session(trial);
    ScratchTicket const ticket(session);
    Slots slots(session);
    int result = -1;
    slots.Open(ticket.Type(), MissingId(slots, ticket.Type()), &result);
    trial.ExpectRefusal("K2", result);
}

void Close(Trial& trial)
{
    Session session(trial);
    ScratchTicket const ticket(session);
    Slots slots(session);
    if (!slots.Open(ticket.Type(), ticket.Id()))
        throw Skipped("the ticket cannot be opened; see tickets.open");
    trial.ExpectSuccess("K4", slots.Close(ticket.Type(), ticket.Id()));
    trial.Expect("K4", slots.Open(ticket.Type(), ticket.Id()), "null, after it was closed",
                 "a ticket that can be opened again");
    slots.Close(ticket.Type(), ticket.Id());
}

void Delete(Trial& trial)
{
    Session session(trial);
    ScratchTicket ticket(session);
    if (!ticket.IsOwn())
        throw Skipped("no ticket can be made; name a type with --option ticket-type=N");
    Slots slots(session);
    InContainer subject(trial, session.Container(), ticket.Type(), ticket.Id());
    subject.ExpectWrite("V2", Key("A"), Int(1));
    trial.ExpectSuccess("K5", slots.Delete(ticket.Type(), ticket.Id()));
    subject.ExpectNothing("K5", Key("A"), PARAM_INT);
    int result = -1;
    slots.Open(ticket.Type(), ticket.Id(), &result);
    trial.ExpectRefusal("K5", result);
    ticket.Forget();
}

void Create(Trial& trial)
{
    Session session(trial);
    Slots slots(session);
    if (!slots.Table().MCREATETICKET)
        throw Skipped("the slot MCREATETICKET is null, as it may be");
    ScratchTicket const model(session);
    int const type = model.Type();
    int const id = MissingId(slots, type);
    std::string const seen = Key("Seen");
    char const* const keys[] = {seen.c_str(), nullptr};
    trial.Calling("MCREATETICKET(" + NameOf(type, id) + ", keys)");
    STICKET_ACCESS const* const made = slots.Table().MCREATETICKET(slots.Table().Instance, type, id, keys);
    if (!made)
        throw Skipped("the plug-in refuses to make a ticket of the type " + std::to_string(type));
    {
        WithTable subject(trial, made);
        subject.ExpectWrite("K6", seen, Int(3));
        InContainer outside(trial, session.Container(), type, id);
        outside.ExpectValue("K6", seen, Int(3));
    }
    slots.Close(type, id);
    slots.Delete(type, id);
}

void Partial(Trial& trial)
{
    Session session(trial);
    ScratchTicket const ticket(session);
    Slots slots(session);
    InContainer subject(trial, session.Container(), ticket.Type(), ticket.Id());
    subject.ExpectWrite("V2", Key("Seen"), Int(1));
    std::string const seen = Key("Seen");
    char const* keys[] = {seen.c_str(), nullptr};
    if (slots.Operate(ticket.Type(), ticket.Id(), STICKET_OP_SET_PARTIAL, "STICKET_OP_SET_PARTIAL", keys) ==
        0)
        throw Skipped("the plug-in has no partial tickets");
    subject.ExpectValue("K7", Key("Seen"), Int(1));
}

void WalkTickets(Trial& trial)
{
    Session session(trial);
    ScratchTicket const first(session);
    Slots slots(session);
    auto ids = slots.Walk(first.Type());
    trial.Expect("K8", std::count(ids.begin(), ids.end(), first.Id()) == 1,
                 "the ticket " + std::to_string(std::count(ids.begin(), ids.end(), first.Id())) + " times",
                 "each ticket once");
    std::sort(ids.begin(), ids.end());
    trial.Expect("K8", std::adjacent_find(ids.begin(), ids.end()) == ids.end(), "a ticket twice",
                 "each ticket once");
}

void WalkStop(Trial& trial)
{
    Session session(trial);
    ScratchTicket const first(session);
    ScratchTicket const second(session);
    Slots slots(session);
    if (slots.Walk(first.Type()).size() < 2)
        throw Skipped("there are fewer than two tickets of a type");
    auto const calls = slots.Walk(first.Type(), 1).size();
    trial.Expect("K8", calls == 1, std::to_string(calls) + " calls of an action that ended it at once", "1");
}

// Which pairs are refused before anything is looked for.
void OddAddresses(Trial& trial)
{
    Session session(trial);
    Slots slots(session);
    MTICKET_ACCESS const& table = slots.Table();
    for (auto const& [type, id] : {std::pair{-1, -1},
                                   {-1, 1},
                                   {100, 1},
                                   {INT_MAX, INT_MAX},
                                   {INT_MIN, 0},
                                   {3, -1},
                                   {3, -2},
                                   {3, INT_MIN},
                                   {3, 1 << 24},
                                   {3, INT_MAX}})
    {
        InContainer subject(trial, session.Container(), type, id);
        subject.ExpectNothing("K9", Key("A"), PARAM_INT);
        trial.ExpectRefusal("K9", subject.Write(Key("A"), Int(1)));
        int result = -1;
        slots.Open(type, id, &result);
        trial.ExpectRefusal("K9", result);
        trial.ExpectRefusal("K9", slots.Delete(type, id));
        trial.Calling("MENDISNOTIF(" + NameOf(type, id) + ", -1, false, null)");
        trial.ExpectRefusal("K9", table.MENDISNOTIF(table.Instance, type, id, -1, false, nullptr));
    }
}

template <typename Run>
auto WithOptions(Run run)
{
    return [run](Trial& trial)
    {
        Session session(trial);
        ScratchTicket const ticket(session);
        Opened const opened(session, ticket.Type(), ticket.Id());
        if (!opened.Table()->SOPTION)
            throw Skipped("the ticket's slot SOPTION is null");
        run(trial, session, *opened.Table());
    };
}

void WhoAmI(Trial& trial, Session&, STICKET_ACCESS const& ticket)
{
    struct
    {
        STICKET_OPTION_WHOAMI who;
        unsigned char behind[16];
    } place;
    std::memset(&place, 0xA5, sizeof place);
    trial.Calling("SOPTION(STICKET_OP_WHOAMI, &who)");
    int const result = ticket.SOPTION(ticket.Instance, STICKET_OP_WHOAMI, &place.who);
    trial.Expect("K10", result == 0 || result == 1, std::to_string(result), "1 or 0");
    bool const isUntouched = std::all_of(std::begin(place.behind), std::end(place.behind),
                                         [](unsigned char byte) { return byte == 0xA5; });
    trial.Expect("K10", isUntouched, "a change behind the 16 bytes", "16 bytes");
    constexpr unsigned long long Soiled = 0xA5A5A5A5A5A5A5A5ULL;
    trial.Expect("K10", result == 0 || place.who.word0 != Soiled || place.who.word8 != Soiled,
                 "1, and two untouched words", "two words");
}

void FolderVariables(Trial& trial, Session& session, STICKET_ACCESS const& ticket)
{
    void* ofTicket = nullptr;
    trial.Calling("SOPTION(STICKET_OP_FOLDER_VARIABLES, &translator)");
    int const result = ticket.SOPTION(ticket.Instance, STICKET_OP_FOLDER_VARIABLES, &ofTicket);
    trial.Expect("K11", result == 0 || result == 1, std::to_string(result), "1 or 0");
    trial.Expect("K11", result == 0 || ofTicket, "1, and null", "a translator");
    void* ofContainer = nullptr;
    Slots slots(session);
    int const answer = slots.Operate(TICKET_ID_NONE, TICKET_ID_NONE, MTICKET_OP_FOLDER_VARIABLES,
                                     "MTICKET_OP_FOLDER_VARIABLES", &ofContainer);
    trial.Expect("K11", answer == 0 || ofContainer, "success, and null", "a translator");
}

void UnknownOption(Trial& trial, Session&, STICKET_ACCESS const& ticket)
{
    for (int const code : {0, -1, 4, 9, 12, 99, 110, INT_MAX})
    {
        void* out[4] = {};
        trial.Calling("SOPTION(" + std::to_string(code) + ", &out)");
        trial.ExpectRefusal("K12", ticket.SOPTION(ticket.Instance, code, out));
    }
}
}  // namespace

std::vector<Check> TicketChecks()
{
    return {
        {"tickets.create-next", CreateNext},
        {"tickets.open", Open},
        {"tickets.open-missing", OpenMissing},
        {"tickets.close", Close},
        {"tickets.delete", Delete},
        {"tickets.create", Create},
        {"tickets.partial", Partial},
        {"tickets.walk", WalkTickets},
        {"tickets.walk-stop", WalkStop},
        {"tickets.odd-addresses", OddAddresses},
        {"options.who-am-i", WithOptions(WhoAmI)},
        {"options.folder-variables", WithOptions(FolderVariables)},
        {"options.unknown", WithOptions(UnknownOption)},
    };
}
}  // namespace validate
