// A site with two programs as its users should find it: maps and vectors, and no thought of how a server goes
// about it. A step gives the text that the real module must give, too.
#pragma once

#include "tests/module/ModelFiles.h"
#include "tests/module/PlainNotifications.h"
#include <array>

class MODULE_MODEL
{
public:
    MODULE_MODEL();

    // The answer to a step other than a walk; nothing for a step that makes no sense now.
    std::optional<std::string> Run(STEP const& step);

    // Does the answer depend on what has been delivered by now?
    static bool EndsNotifications(ACTION action);

    // --- a walk over tickets, which the caller leads
    std::optional<std::vector<int>> BeginTickets(STEP const& step) const;  // nothing if it is refused
    struct VISIT
    {
        PLAIN_ADDRESS ticket;
        unsigned incarnation = 0;
    };
    std::optional<VISIT> Visited(STEP const& step, int id) const;  // nothing for a ticket that is gone
    std::string TextOf(STEP const& step, VISIT const& visit) const;

    // --- a walk over the values of a ticket
    struct VALUE_WALK
    {
        int session = 0;
        std::optional<std::size_t> file{};
        std::vector<std::string> keys{};   // of a file, whose values are as they are when their turn comes
        std::vector<std::string> lines{};  // of any other ticket, as it is at the beginning
        std::size_t next = 0;
        int pos = 0;
    };
    bool HasBegun(STEP const& step) const { return Who(step).hasBegun; }
    bool HasValues(STEP const& step) const;                   // whether the step makes sense now
    std::optional<VALUE_WALK> BeginValues(STEP const& step);  // nothing if it is refused
    std::optional<std::string> NextValue(VALUE_WALK& walk) const;
    void End(VALUE_WALK const& walk);

    // What the clients of a program have been told since this was asked last.
    std::string News(std::size_t program) { return m_notifications[program].News(); }
    bool IsHeld() const { return m_notifications[0].IsHeld(); }
    bool IsAlive(int session) const { return m_sessions[static_cast<std::size_t>(session)].isAlive; }

    // Every ticket as a program sees it, and what lies in the folders. Program 2 comes later than all this.
    std::string Everything(std::size_t program) const;
    std::string Folders() const;  // the ticket files among them

    // A path of the server's, as far as it can be looked at without the server: $(VARIABLE)/folder/name.
    struct SERVER_FILE
    {
        std::string variable;
        std::string folder;
        std::string name;
    };

private:
    struct TICKET_MODEL
    {
        unsigned incarnation = 0;
        PLAIN_TICKET seen[3]{};  // by each program: pointers are of use in one alone
        std::string jobFile{};   // empty for a ticket without one
        std::string jobContent{};
    };
    struct TABLE
    {
        PLAIN_ADDRESS ticket;
        unsigned incarnation;  // which it stands for; 0: none
        int openings = 0;
    };
    struct SESSION
    {
        bool hasBegun = false;
        bool isAlive = false;
        bool isAdministrator = false;
        std::map<PLAIN_ADDRESS, PLAIN_FILTER> limits{};
        std::vector<TABLE> tables{};
        std::map<PLAIN_ADDRESS, std::size_t> tableOf{};  // the one that an opening gives
        std::optional<std::size_t> client{};             // of the notifications
        int notification = 0;
    };
    struct PREPARED
    {
        int session;
        std::string name;
        VISIT job;
    };
    struct FILE_MODEL
    {
        bool isOpen = false;
        int file = -1;
        bool isChanged = false;
        int walks = 0;  // that run
        PLAIN_TICKET content{};
    };
    using LINE = std::optional<std::string>;

    SESSION& Who(STEP const& step) { return m_sessions[static_cast<std::size_t>(step.session)]; }
    SESSION const& Who(STEP const& step) const { return m_sessions[static_cast<std::size_t>(step.session)]; }
    static std::size_t ProgramOf(STEP const& step) { return step.IsElsewhere() ? 1 : 0; }
    PLAIN_NOTIFICATIONS& Told(STEP const& step) { return m_notifications[ProgramOf(step)]; }
    FILE_MODEL* FileOf(STEP const& step);
    FILE_MODEL const* FileOf(STEP const& step) const { return const_cast<MODULE_MODEL*>(this)->FileOf(step); }

    TICKET_MODEL* Find(VISIT const& visit);  // incarnation 0: whichever has the address
    TICKET_MODEL const* Find(VISIT const& visit) const
    {
        return const_cast<MODULE_MODEL*>(this)->Find(visit);
    }
    VISIT TargetOf(STEP const& step) const;  // address -1/-1: none
    bool Sees(STEP const& step, PLAIN_ADDRESS ticket, std::string const& key) const;
    std::vector<std::string> LinesOf(STEP const& step, VISIT const& visit) const;
    bool MayWrite(STEP const& step, PLAIN_ADDRESS ticket) const;

    bool MakesSense(STEP const& step) const;
    std::string LogIn(STEP const& step);
    std::string LogOut(STEP const& step);
    std::string Read(STEP const& step) const;
    std::string ReadTable(STEP const& step) const;
    std::string Write(STEP const& step);
    std::string WriteTable(STEP const& step);
    bool WriteRecords(STEP const& step, std::vector<MODEL_RECORD> const& records, std::string& oks);
    std::string Open(STEP const& step);
    std::string OpenNow(STEP const& step, PLAIN_ADDRESS ticket);
    std::string Close(STEP const& step);
    std::string Create(STEP const& step);
    std::string CreateNext(STEP const& step);
    std::string Delete(STEP const& step);
    std::string Limit(STEP const& step);
    std::string WhoAmI(STEP const& step) const;
    std::string TicketData(STEP const& step) const;
    std::string Register(STEP const& step);
    std::string Switch(STEP const& step);
    LINE Hold(STEP const&);
    LINE Release(STEP const&);
    LINE Flood(STEP const& step);
    TICKET_MODEL const* JobIn(std::string const& folder) const;
    int CodeOfFolder(SERVER_FILE const& file, bool isPut) const;
    int Put(STEP const& step, SERVER_FILE const& to, std::string& content);
    int Get(STEP const& step, SERVER_FILE const& from, std::string& content) const;
    std::string Carry(STEP const& step);
    int CarryNow(STEP const& step, std::optional<std::string>& fetched);
    std::string PrepareJob(STEP const& step);
    std::string SendJob(STEP const& step);
    std::string OpenFile(STEP const& step);
    LINE CloseFile(STEP const& step);

    int NextId(int type) const;
    std::optional<VISIT> Claimed(STEP const& step);
    VISIT Make(PLAIN_ADDRESS ticket);
    void Remove(PLAIN_ADDRESS ticket);
    VISIT MakeJob(STEP const& step, std::string const& name, int queue, int copies);
    // A change that a program has made becomes one of both.
    void Spread(std::size_t program, PLAIN_ADDRESS ticket, std::vector<PLAIN_CHANGE> const& changes);
    void WriteOwn(std::size_t program, PLAIN_ADDRESS ticket, std::vector<MODEL_RECORD> const& records);

    std::map<PLAIN_ADDRESS, TICKET_MODEL> m_tickets;
    unsigned m_incarnations = 0;
    std::array<SESSION, STEP::Sessions> m_sessions;
    PLAIN_NOTIFICATIONS m_notifications[2];
    int m_newestNotification[2] = {1, 1};  // the first is the test's own
    bool m_isFlooded = false;
    std::vector<PREPARED> m_prepared;
    std::map<std::string, std::string> m_temp;  // the files of $(TEMP)
    FILE_MODEL m_files[STEP::OpenFiles];
    PLAIN_TICKET m_saved[TicketFiles];
};
