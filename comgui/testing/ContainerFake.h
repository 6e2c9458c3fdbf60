// A ticket container in memory for tests of whatever calls one: it answers as a real container does, writes
// down every call, and fails where it is told to. It keeps each text that was ever written until its own
// end, so no text it gave out dies early. A slot that is called with another Instance throws, and so fails
// the test. For one thread.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <deque>
#include <map>
#include <optional>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

class clFOLDER_VARIABLES;

namespace comgui::test
{
enum class SLOT
{
    GET,         // MGETPARAMETER
    GETTABLE,    // MGETMULTIPAR
    WALK,        // MWALKTICKETS
    SET,         // MSETPARAMETER
    SETTABLE,    // MSETMULTIPAR
    OPERATION,   // MOPERATION
    SWITCH,      // MENDISNOTIF
    CREATE,      // MCREATETICKET
    WALKVALUES,  // SWALKPARAMETERS of a TicketFake, with its prefix as the key
};

// One call as it came in. What a slot has no argument for keeps its default, so a test names what it means:
// EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "Key", PARAM_INT, 0})).
struct CALL
{
    SLOT slot;
    int type;
    int id = 0;  // MWALKTICKETS has none
    std::string key{};
    PARAM_TYPE ptype = PARAM_NONE;
    int pos = 0;
    int op = 0;            // MOPERATION
    void* arg = nullptr;   // MOPERATION
    int notification = 0;  // MENDISNOTIF
    bool enable = false;   // MENDISNOTIF
    std::vector<std::string> keys{};

    friend bool operator==(CALL const& left, CALL const& right);
    friend bool operator!=(CALL const& left, CALL const& right) { return !(left == right); }
    friend void PrintTo(CALL const& call, std::ostream* out);
};

class ContainerFake
{
    static constexpr unsigned long long Mark = 0x434F4E5441494E45;
    unsigned long long const m_mark = Mark;  // the first word: whatever else comes as Instance has another

public:
    ContainerFake();
    ContainerFake(ContainerFake const&) = delete;
    ContainerFake& operator=(ContainerFake const&) = delete;

    // The table; it dies with the fake. Slots may be set to null or to others.
    MTICKET_ACCESS* Access() { return &m_access; }

    std::vector<CALL> calls;  // a table slot is one entry, followed by one GET or SET for each record

    int success = 1;  // what a slot returns when it succeeds

    // Makes the nth call of any slot from now on fail, 0 being the next. The records of a table count too.
    void FailCall(int n) { m_failIn = n; }

    // Makes every read and write at that position fail.
    void FailPosition(int pos) { m_failPosition = pos; }

    // What MTICKET_OP_FOLDER_VARIABLES gives out; the operation fails while there is none.
    clFOLDER_VARIABLES* folders = nullptr;

    // What MTICKET_OP_OPEN gives out for any ticket there is, instead of a table with nothing in it.
    STICKET_ACCESS const* opened = nullptr;

    // Reads of texts succeed and give null.
    bool nullTexts = false;

    // The walk of a TicketFake over the values that the ticket has when it begins.
    int WalkValues(int type, int id, SWALKPARAMETERS_ACTION action, void* context, char const* prefix);

    // Prepare a ticket without a trace in calls. A ticket that was never added refuses every write; Put adds
    // it. pos as in a slot.
    void AddTicket(int type, int id);
    void Put(int type, int id, char const* key, int value, int pos = -1);
    void Put(int type, int id, char const* key, double value, int pos = -1);
    void Put(int type, int id, char const* key, char const* value, int pos = -1);
    void Put(int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos);

    // What a slot would read, without a trace in calls.
    bool HasTicket(int type, int id) const;
    bool Read(int type, int id, char const* key, PARAM_TYPE ptype, void* value, int pos) const;
    std::optional<int> Int(int type, int id, char const* key, int pos = -1) const;
    std::optional<double> Double(int type, int id, char const* key, int pos = -1) const;
    std::optional<std::string> Text(int type, int id, char const* key, int pos = -1) const;
    unsigned long Count(int type, int id, char const* key) const;  // 0 for a missing key

private:
    // A number or pointer stands in number, bit by bit; texts and bytes in *bytes.
    struct VALUE
    {
        PARAM_TYPE type;
        unsigned long long number;
        std::string const* bytes;
    };
    using VALUES = std::map<int, VALUE>;  // by position
    using TICKET = std::map<std::string, VALUES>;

    static ContainerFake& Of(void* instance);  // throws std::logic_error for any other
    bool Fails(std::optional<int> pos);        // told to fail here?
    bool Get(CALL call, char const* key, void* value);
    bool Set(CALL call, char const* key, void const* value);
    bool Write(int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos);
    bool Erase(TICKET& ticket, char const* key, int pos);
    std::optional<VALUE> Made(PARAM_TYPE ptype, void const* value);

    static int OnGet(void*, int, int, char const*, PARAM_TYPE, void*, int);
    static int OnGetTable(void*, int, int, GETMULTIPAR*);
    static int OnWalk(void*, MWALKTICKETS_ACTION, void*, int);
    static int OnSet(void*, int, int, char const*, PARAM_TYPE, void const*, int);
    static int OnSetTable(void*, int, int, SETMULTIPAR*);
    static int OnOperation(void*, int, int, TICKET_OP, void*);
    static int OnSwitch(void*, int, int, int, bool, char const* const*);
    static STICKET_ACCESS const* OnCreate(void*, int, int, char const* const*);

    MTICKET_ACCESS m_access{};
    STICKET_ACCESS m_ticket{};  // handed out where a ticket's table is asked for; its slots are null
    std::map<std::pair<int, int>, TICKET> m_tickets;
    std::deque<std::string> m_texts;
    std::deque<unsigned long long> m_numbers;  // that walks handed out
    int m_failIn = -1;
    std::optional<int> m_failPosition;
};
}  // namespace comgui::test
