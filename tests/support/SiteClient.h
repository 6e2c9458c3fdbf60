// One session with the server of the site that COMGUI_SITE names, through the library and the plug-in that
// lies beside it, with verbs for programs that test or measure a site. Single values are PARAM_INT64.
//
// One object a process, since it uses the session that the library itself holds. For one thread at a time;
// the handler of Listen() runs on the server's own thread, and may use the verbs that are const.
#pragma once

#include "comgui/comgui.h"
#include <cstdint>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

struct TicketName
{
    int type;
    int id;
};

// A notification; valid during the call only.
struct Heard
{
    enum Kind : int
    {
        Changed = 1,
        Created = 4,
        Deleted = 5,
        TransferEnded = 6,
    };

    int kind;
    TicketName ticket;
    SETMULTIPAR const* records;  // ended by a null key; null where there are none
};

class SiteClient
{
public:
    SiteClient() = default;
    ~SiteClient();  // logs out; no handler runs any more
    SiteClient(SiteClient const&) = delete;
    SiteClient& operator=(SiteClient const&) = delete;

    // Makes the folder of a new site, with a seed of its own: the users that every new site has, with hashes
    // that take next to no time to verify, so that programs start fast. A site that is there stays as it is.
    static void MakeSite(std::filesystem::path const& folder);

    int LogIn(char const* user = "admin", char const* password = "admin");  // 0, or the plug-in's code
    static ComGUIManager& Manager() { return *ComGUIManager::GetInstance(); }

    // Single values. Positions are the container's: -1 the key as a whole, -2 behind the last value.
    bool Set(TicketName ticket, char const* key, std::int64_t value, int pos = -1) const;
    bool Remove(TicketName ticket, char const* key, int pos = -1) const;
    std::optional<std::int64_t> Get(TicketName ticket, char const* key, int pos = -1) const;
    std::size_t Count(TicketName ticket, char const* key) const;
    std::vector<std::int64_t> List(TicketName ticket, char const* key) const;  // gaps are left out

    // A table: TableSize keys that have one value, all written by one call. Reading it gives all the values
    // that were found, in one call of MGETMULTIPAR, or of GetTicketData.
    static constexpr std::size_t TableSize = 40;
    bool SetTable(TicketName ticket, std::int64_t value) const;
    std::vector<std::int64_t> Table(TicketName ticket) const;
    std::vector<std::int64_t> TableOfXml(TicketName ticket) const;
    static bool IsWhole(std::vector<std::int64_t> const& table);  // all of one write, or not there at all

    // Whole tickets.
    bool Create(TicketName ticket) const;
    std::optional<int> CreateNext(int type) const;
    bool Delete(TicketName ticket) const;
    std::vector<int> Ids(int type) const;
    STICKET_ACCESS const* Open(TicketName ticket) const;

    // Jobs and files of the session that is open.
    static int PrepareJob(std::string const& name);          // the id of its ticket, -1 if it is refused
    static int SendJob(std::string path, std::string name);  // 0, or the plug-in's code
    static std::optional<int> StateOfJob(int id);
    enum class Sync
    {
        Now,    // answers how it ended
        Later,  // does not wait for the end
    };
    static int PutFile(std::string source, std::string serverPath, Sync sync = Sync::Now);  // as SendJob
    static int GetFile(std::string serverPath, std::string target);                         // the same

    // Has the handler called with all that is enabled later on, one call at a time. Once.
    bool Listen(std::function<void(Heard const&)> handler);
    bool Enable(int type) const;  // every change of every ticket of that type

private:
    int Operate(TicketName ticket, MTICKET_OP op, void* arg) const;
    static void Call(void* user, int kind, int argA, int argB, int code, void* data);

    MTICKET_ACCESS const* m_tickets = nullptr;
    std::function<void(Heard const&)> m_handler;
    int m_notification = -1;
};

// A list of numbers that any number of programs append to at once. It lies in blocks of BlockSize values or a
// few more, each a ticket of its own, so that no ticket grows without end: block 1 is the ticket with id 1.
class SharedList
{
public:
    static constexpr std::size_t BlockSize = 256;

    // block: where to look for the end first.
    SharedList(SiteClient const& client, int type, int block = 1)
        : m_client(client), m_type(type), m_block(block)
    {
    }

    bool Append(std::int64_t value);
    int Block() const { return m_block; }  // the one of the last Append

    // Calls action with the values from that block to the end, in their order.
    void Walk(int block, std::function<void(std::int64_t value)> const& action) const;

private:
    SiteClient const& m_client;
    int const m_type;
    int m_block;
};
