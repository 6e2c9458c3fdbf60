// One thread of a fuzz input for the module: calls entries and slots step by step, and knows what must come
// of them.
#pragma once

#include "fuzz/ModuleClients.h"

class CALLER
{
public:
    CALLER(CLIENTS& clients, INPUT input) : m_clients(clients), m_site(clients.site), m_input(input) {}

    void Run();

    bool HasTexts() const { return !m_texts.IsEmpty() || !m_passingTexts.IsEmpty(); }  // that it has read
    void MustHoldItsTexts() const;  // while the sessions live

    void DestroyTickets();  // those out of files and in memory

private:
    using STEP = void (CALLER::*)();

    // One record of a write, with what its value points at.
    struct RECORD
    {
        char const* key;
        VALUE value;
        int pos;

        RECORD(KEYS& keys, INPUT& input) : key(keys.Next(input)), value(input), pos(NextPosition(input)) {}
    };

    void Step();

    // Values of tickets in the container. ModuleCaller.cpp
    void Read();
    void ReadTable();
    void Write();
    void WriteTable();
    std::vector<SETMULTIPAR> NextTable(std::deque<RECORD>& records);

    // What the read must give.
    std::optional<std::string> Expected(CLIENT_SESSION const& session, ADDRESS address, char const* key,
                                        PARAM_TYPE type, int pos) const;

    // before: the ticket, nothing for none; done: which records the module says it has carried out. Compares
    // that, and the ticket as it is now, with the model.
    void MustBeDone(CLIENT_SESSION const& session, ADDRESS address, std::optional<MODEL_TICKET> before,
                    std::deque<RECORD> const& records, std::vector<bool> const& done) const;

    // Tickets as a whole. ModuleCaller_Tickets.cpp
    void Create();
    void CreateNext(CLIENT_SESSION& session, int type, bool mayBe);
    void Delete();
    void Open();
    void Close();
    void UseOpened();
    void UseSlots(STICKET_ACCESS const& ticket, TEXTS* texts);
    void Limit();
    void WalkTickets();
    void GetData();
    void MustBeXmlOf(ADDRESS address, std::string_view text, CLIENT_SESSION const& session) const;
    void Translate();
    int Operate(CLIENT_SESSION const& session, ADDRESS address, int code, void* arg) const;

    // Entries of the module. ModuleCaller_Entries.cpp
    void Register();
    void Switch();
    void Command();
    void PrepareJob();
    void SendJob();
    void PutFile();
    void GetFile();
    void BeginFile();
    std::string NextLocalPath();
    std::string NextServerPath();
    void CreateLocal();
    void UseLocal();
    void DestroyLocal();
    void LogIn();
    void LogOut();
    void AskServer();
    void WrongHandles();

    CLIENT_SESSION& NextSession() { return m_clients.sessions[m_input.Among(4) / 3]; }
    TEXTS* TextsOf(CLIENT_SESSION const& session);

    // As the observer finds it; nothing either if other threads may change it meanwhile.
    std::optional<MODEL_TICKET> Content(ADDRESS address) const;

    CLIENTS& m_clients;
    MODULE_SITE& m_site;
    INPUT m_input;
    KEYS m_keys;
    TEXTS m_texts;
    TEXTS m_passingTexts;  // of the session that may end
    std::vector<std::pair<CLIENT_SESSION const*, STICKET_ACCESS const*>> m_opened;
    std::vector<STICKET_ACCESS const*> m_locals;  // tickets out of files and in memory
    int m_depth = 0;                              // of walks
};

// Carries out a record on a ticket with that content, if it can be: not if that would take away that clients
// come to an end with the folders of the system ticket.
bool IsDone(MODEL_TICKET& content, char const* key, VALUE const& value, int pos, bool isSystem);

// Of an entry.
void MustBeACode(int code);
