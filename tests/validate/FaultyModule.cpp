// The package's own module with one fault in front of it, which COMGUI_FAULT names: what comgui_validate must
// find. Without a fault it is that module.
#include "comgui/access/STICKET_READ.h"
#include "comgui/session/ComGUIModuleInterface.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/TICKET_ID.h"
#include <CoreFoundation/CoreFoundation.h>
#include <atomic>
#include <chrono>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <dlfcn.h>
#include <fstream>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <string_view>
#include <thread>
#include <unistd.h>
#include <vector>

extern "C" __attribute__((visibility("default"))) void* FaultyModuleFactory(CFAllocatorRef, CFUUIDRef);

namespace
{
bool Has(std::string_view fault)
{
    static std::string const planted = std::getenv("COMGUI_FAULT") ? std::getenv("COMGUI_FAULT") : "";
    return planted == fault;
}

ComGUIModuleInterface real;
ComGUIModuleInterface table;
ComGUIModuleInterface* interface = &table;
MTICKET_ACCESS realContainer;
STICKET_ACCESS realTicket;
STicketFactory factory;
std::recursive_mutex lock;

bool Ends(char const* key, std::string_view end) { return std::string_view(key).ends_with(end); }

// --- the bundle

int QueryInterface(void*, COMGUI_UUID id, void** out)
{
    constexpr unsigned char Interface = 0x33;  // the first byte of the interface's UUID
    if (Has("no-interface") || (id.bytes[0] != Interface && !Has("any-interface")))
        return 1;
    *out = &interface;
    return 0;
}

unsigned int Release(void*)
{
    if (Has("release-frees"))
        std::memset(static_cast<void*>(&table), 0, sizeof table);
    return 1;
}

int Open(void** instance) { return Has("open-fails") ? 5 : real.Open(instance); }

// --- the server

int IsAlive(void* instance, char const* host, int port)
{
    if (Has("alive-always") || Has("alive-never"))
        return Has("alive-always") ? 0 : 105;
    return real.IsAliveEntry(instance, host, port);
}

unsigned int GetLocalAddress(void* instance, char const* host, int port)
{
    unsigned int const address = real.GetLocalAddressEntry(instance, host, port);
    return Has("address-swapped") ? __builtin_bswap32(address) : address;
}

// --- sessions

std::map<void*, std::thread::id> sessions;  // and who has logged in
std::map<TLogin*, int> initialised;
bool hasRefused = false;
std::atomic<int> loginsUnderWay{0};

std::string LockFile() { return std::string(std::getenv("COMGUI_SITE")) + ".lock"; }

int Initialize(void* instance, TLogin* login, int stamp)
{
    int const code = real.InitializeEntry(instance, login, stamp);
    if (Has("initialize-changes-port"))
        login->iLocalPort += 7;
    std::lock_guard const held(lock);
    return Has("again-refused") && ++initialised[login] > 1 ? 9 : code;
}

bool IsLoginRefused()
{
    std::lock_guard const held(lock);
    if (Has("second-login-refused") && !sessions.empty())
        return true;
    if (Has("refusal-sticks") && hasRefused)
        return true;
    if (!Has("death-locks"))
        return false;
    int owner = 0;
    std::ifstream(LockFile()) >> owner;
    if (owner != 0 && owner != getpid())
        return true;
    std::ofstream(LockFile()) << getpid();
    return false;
}

void SpoilLogin(TLogin* login, int role)
{
    if (Has("login-keeps-role"))
        login->iUserRole = role;
    if (Has("login-renames"))
        std::strcpy(login->szUser, "somebody");
    if (Has("login-endless-text"))
        std::memset(login->szLocalEndPoint, 'x', sizeof login->szLocalEndPoint);
    if (Has("login-no-handle"))
        login->hSession = nullptr;
    if (Has("table-changes"))
        table.reserved40 = &table;
}

int Login(void* instance, TLogin* login)
{
    int const role = login->iUserRole;
    struct UnderWay
    {
        int const before = loginsUnderWay++;
        ~UnderWay() { --loginsUnderWay; }
    } const here;
    if (IsLoginRefused() || (Has("logins-collide") && here.before > 0))
        return 7;
    if (Has("logins-collide"))
        std::this_thread::sleep_for(std::chrono::milliseconds(100));  // so that they meet
    int const code = real.LoginEntry(instance, login);
    std::lock_guard const held(lock);
    if (code != 0)
    {
        hasRefused = true;
        return Has("wrong-password-accepted") ? 0 : code;
    }
    sessions[login->hSession] = std::this_thread::get_id();
    SpoilLogin(login, role);
    return 0;
}

int Logout(void* instance, void* session)
{
    if (Has("logout-does-nothing") && session)
        return 0;
    {
        std::lock_guard const held(lock);
        sessions.erase(session);
        if (Has("death-locks"))
            std::remove(LockFile().c_str());
    }
    int const code = real.LogoutEntry(instance, session);
    return Has("logout-code") && code == 0 ? 5 : code;
}

int Uninitialize(void* instance, TLogin* login)
{
    int const code = real.UninitializeEntry(instance, login);
    return Has("uninitialize-code") ? 5 : code;
}

// --- values of a container

// What a write keeps, against the rule, and does once more before the next read.
struct KEPT
{
    int type;
    int id;
    char const* key;
    PARAM_TYPE what;
    void const* value;
} kept{};

bool IsOddThread(void* instance)
{
    if (!Has("thread-bound"))
        return false;
    std::lock_guard const held(lock);
    (void)instance;
    return !sessions.empty() && sessions.begin()->second != std::this_thread::get_id();
}

char const* Plain(char const* key, std::string& place)
{
    place = key;
    if (Has("keys-trimmed") && !place.empty() && place.back() == '/')
        place.pop_back();
    return place.c_str();
}

void SpoilRead(PARAM_TYPE what, void* value, int position)
{
    static std::atomic<int> shared;
    if (Has("wide-read") && what == PARAM_UNSIGNED)
        std::memset(static_cast<char*>(value) + 4, 0, 4);
    if (Has("narrow-int64") && what == PARAM_INT64)
        *static_cast<long long*>(value) = static_cast<int>(*static_cast<long long*>(value));
    if (Has("type-of-list") && what == PARAM_NONE && position == -1 &&
        *static_cast<int*>(value) == PARAM_COUNT)
        *static_cast<int*>(value) = PARAM_INT;
    if (Has("threads-share") && what == PARAM_INT)
    {
        shared = *static_cast<int*>(value);
        std::this_thread::sleep_for(std::chrono::microseconds(200));  // so that they meet
        *static_cast<int*>(value) = shared;
    }
    if (Has("text-cut") && what == PARAM_STRING)
    {
        thread_local std::string text;
        text = std::string(*static_cast<char const**>(value)).substr(0, 255);
        *static_cast<char const**>(value) = text.c_str();
    }
}

int ReadCount32(void* instance, int type, int id, char const* key, void* value, int position)
{
    unsigned long count = 0;
    int const result = realContainer.MGETPARAMETER(instance, type, id, key, PARAM_COUNT, &count, position);
    if (result != 0)
        std::memcpy(value, &count, 4);
    return result;
}

int Get(void* instance, int type, int id, char const* key, PARAM_TYPE what, void* value, int position)
{
    std::string place;
    if (IsOddThread(instance))
        return 0;
    if (Has("odd-key-crash") && std::strlen(key) > 1000)
        std::abort();
    if (Has("odd-position-hang") && position == INT_MAX)
        std::this_thread::sleep_for(std::chrono::hours(1));
    if (Has("odd-address-taken") && type == 100)
        return 1;
    if (Has("position-0-missing") && position == 0 && Ends(key, "Alone"))
        return 0;
    if (kept.key && kept.type == type && kept.id == id)
        realContainer.MSETPARAMETER(instance, type, id, "ComGUIValidate/Kept", kept.what, kept.value, -1);
    if (Has("count-32") && what == PARAM_COUNT)
        return ReadCount32(instance, type, id, key, value, position);
    int const result =
        realContainer.MGETPARAMETER(instance, type, id, Plain(key, place), what, value, position);
    if (result != 0)
        SpoilRead(what, value, position);
    else if (Has("read-touches") && Ends(key, "Missing"))
        *static_cast<int*>(value) = 0;
    return result;
}

bool IsWriteLost(char const*, PARAM_TYPE what, int position)
{
    return (Has("delete-does-nothing") && what == PARAM_NONE) ||
           (Has("delete-one-does-nothing") && what == PARAM_NONE && position > 0);
}

int SetText(void* instance, int type, int id, char const* key, char const* text, int position)
{
    std::string ascii = text;
    for (char& letter : ascii)
        if (static_cast<unsigned char>(letter) > 127)
            letter = '?';
    return realContainer.MSETPARAMETER(instance, type, id, key, PARAM_STRING, ascii.c_str(), position);
}

int Set(void* instance, int type, int id, char const* key, PARAM_TYPE what, void const* value, int position)
{
    std::string place;
    if (IsOddThread(instance))
        return 0;
    if (IsWriteLost(key, what, position))
        return 1;
    if (Has("write-code-0") && Ends(key, "Limit"))
    {
        realContainer.MSETPARAMETER(instance, type, id, key, what, value, position);
        return 0;
    }
    if (Has("write-keeps") && Ends(key, "Kept") && what == PARAM_STRING)
        kept = {type, id, key, what, value};
    if (Has("minus-1-is-0") && position == -1 && what != PARAM_NONE)
        position = 0;
    if (Has("append-replaces") && position == -2)
        position = 0;
    if (Has("write-clears-list") && position > 0 && Ends(key, "List") && what == PARAM_INT &&
        *static_cast<int const*>(value) == 99)
        realContainer.MSETPARAMETER(instance, type, id, key, PARAM_NONE, nullptr, -1);
    if (Has("text-ascii") && what == PARAM_STRING)
        return SetText(instance, type, id, key, static_cast<char const*>(value), position);
    if (Has("bytes-end-at-0") && what == PARAM_BINSTRING)
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(value);
        BIN_STRING const cut(bytes.data, strnlen(static_cast<char const*>(bytes.data), bytes.size));
        return realContainer.MSETPARAMETER(instance, type, id, key, what, &cut, position);
    }
    return realContainer.MSETPARAMETER(instance, type, id, Plain(key, place), what, value, position);
}

// --- tables of a container

int SetTable(void* instance, int type, int id, SETMULTIPAR* records)
{
    if (Has("table-looks-behind") && !records->key && records[1].key)
        return realContainer.MSETMULTIPAR(instance, type, id, records + 1);
    if (Has("count-deletes") && records->type == PARAM_COUNT)
        realContainer.MSETPARAMETER(instance, type, id, records->key, PARAM_NONE, nullptr, -1);
    int result = 1;
    if (Has("table-stops") || Has("table-backwards"))
    {
        std::vector<SETMULTIPAR*> order;
        for (SETMULTIPAR* record = records; record->key; ++record)
            order.insert(Has("table-stops") ? order.end() : order.begin(), record);
        for (SETMULTIPAR* const record : order)
        {
            record->ok = realContainer.MSETPARAMETER(instance, type, id, record->key, record->type,
                                                     record->value, record->pos) != 0;
            if (!record->ok && Has("table-stops"))
                break;
        }
    }
    else
        result = realContainer.MSETMULTIPAR(instance, type, id, records);
    for (SETMULTIPAR* record = records; record->key; ++record)
    {
        if (Has("table-always-ok"))
            record->ok = true;
        if (Has("table-writes-records"))
            record->reserved12 = 1;
    }
    return result;
}

int GetTable(void* instance, int type, int id, GETMULTIPAR* records)
{
    std::vector<GETMULTIPAR> before;
    for (GETMULTIPAR const* record = records; record->key; ++record)
        before.push_back(*record);
    int const result = realContainer.MGETMULTIPAR(instance, type, id, records);
    static char shared[256];
    for (std::size_t i = 0; records[i].key; ++i)
    {
        bool const isText = records[i].ok && records[i].type == PARAM_STRING;
        char const*& text = *static_cast<char const**>(records[i].value);
        if (Has("table-reads-touch") && !records[i].ok)
            *static_cast<int*>(records[i].value) = 0;
        if (Has("table-ok-left"))
            std::memcpy(&records[i].ok, &before[i].ok, 1);
        if (Has("table-texts-share") && isText)
        {
            std::strncpy(shared, text, sizeof shared - 1);
            text = shared;
        }
        if (Has("text-goes") && isText)
        {
            char* const copy = strdup(text);
            text = copy;
            std::memset(copy, '#', std::strlen(copy));
        }
    }
    return result;
}

// --- opened tickets

struct WALK
{
    SWALKPARAMETERS_ACTION action;
    void* context;
    int calls = 0;
};

bool Pass(void* place, char const* key, PARAM_TYPE type, void const* word, int position)
{
    auto& walk = *static_cast<WALK*>(place);
    if (Has("walk-skips") && walk.calls++ == 0)
        return true;
    if (Has("walk-text-address") && type == PARAM_STRING)
        return walk.action(walk.context, key, type, "address", position);
    if (Has("walk-flattens"))
        position = -1;
    bool goesOn = walk.action(walk.context, key, type, word, position);
    if (Has("walk-doubles"))
        goesOn = walk.action(walk.context, key, type, word, position);
    return goesOn || Has("walk-goes-on");
}

int Walk(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
{
    WALK walk{action, context};
    if (!Has("walk-elsewhere"))
        return realTicket.SWALKPARAMETERS(instance, Pass, &walk, prefix, limit);
    int result = 0;
    std::thread([&] { result = realTicket.SWALKPARAMETERS(instance, Pass, &walk, prefix, limit); }).join();
    return result;
}

int Option(void* instance, int code, void* out)
{
    if (Has("who-am-i-wide") && code == STICKET_OP_WHOAMI)
        std::memset(out, 1, 24);
    if (Has("who-am-i-empty") && code == STICKET_OP_WHOAMI)
        return 1;
    if (Has("translator-null") && code == STICKET_OP_FOLDER_VARIABLES)
        return 1;
    if (Has("option-unknown-1") && code != STICKET_OP_WHOAMI && code != STICKET_OP_FOLDER_VARIABLES)
        return 1;
    return realTicket.SOPTION(instance, code, out);
}

int OpenedGet(void* instance, char const* key, PARAM_TYPE type, void* value, int position)
{
    return Has("opened-reads-nothing") ? 0 : realTicket.SGETPARAMETER(instance, key, type, value, position);
}

int OpenedSetTable(void* instance, SETMULTIPAR* records)
{
    int const result = realTicket.SSETMULTIPAR(instance, records);
    if (Has("opened-table-not-ok"))
        for (SETMULTIPAR* record = records; record->key; ++record)
            record->ok = false;
    return result;
}

STICKET_ACCESS const* Opened(STICKET_ACCESS const* ticket)
{
    static std::deque<STICKET_ACCESS> tickets;
    std::lock_guard const held(lock);
    realTicket = *ticket;
    tickets.push_back(*ticket);
    STICKET_ACCESS& copy = tickets.back();
    copy.SGETPARAMETER = OpenedGet;
    copy.SSETMULTIPAR = OpenedSetTable;
    copy.SWALKPARAMETERS = Walk;
    copy.SOPTION = Option;
    return &copy;
}

int OpenTicket(void* instance, int type, int id, void* argument)
{
    if (Has("system-ticket-closed") && type == 0 && id == 0)
        return 0;
    auto*& ticket = *static_cast<STICKET_ACCESS const**>(argument);
    int const result = realContainer.MOPERATION(instance, type, id, MTICKET_OP_OPEN, argument);
    if (Has("open-missing-succeeds"))
        return type >= 0 && type < 100 && id >= 0 && id < 1 << 24 ? 1 : result;
    if (result != 0)
        ticket = Has("open-gives-null") ? nullptr : Opened(ticket);
    return result;
}

int CreateNext(void* instance, int type, int id, void* argument)
{
    static int made = 0;
    static int first = -1;
    int& number = *static_cast<int*>(argument);
    std::lock_guard const held(lock);
    if (Has("create-repeats") && made++ > 0)
    {
        number = first;
        return 1;
    }
    int const result = realContainer.MOPERATION(instance, type, id, MTICKET_OP_CREATE_NEXT, argument);
    first = number;
    if (Has("create-makes-nothing") && made++ == 2)
        realContainer.MOPERATION(instance, type, number, MTICKET_OP_DELETE, nullptr);
    return result;
}

int Operation(void* instance, int type, int id, TICKET_OP op, void* argument)
{
    switch (op.GetInt())
    {
    case MTICKET_OP_OPEN:
        return OpenTicket(instance, type, id, argument);
    case MTICKET_OP_CREATE_NEXT:
        return CreateNext(instance, type, id, argument);
    case MTICKET_OP_CLOSE:
        if (Has("close-deletes"))
            realContainer.MOPERATION(instance, type, id, MTICKET_OP_DELETE, nullptr);
        return Has("close-fails") ? 0 : realContainer.MOPERATION(instance, type, id, op, argument);
    case MTICKET_OP_DELETE:
        return Has("ticket-stays") && type != 100 && id >= 0 && id < 1 << 24 && type >= 0
                   ? 1
                   : realContainer.MOPERATION(instance, type, id, op, argument);
    case STICKET_OP_SET_PARTIAL:
        if (Has("partial-hides"))
        {
            char const* const none[] = {"nothing", nullptr};
            return realContainer.MOPERATION(instance, type, id, op, const_cast<char const**>(none));
        }
        return realContainer.MOPERATION(instance, type, id, op, argument);
    default:
        return realContainer.MOPERATION(instance, type, id, op, argument);
    }
}

struct TICKETS
{
    MWALKTICKETS_ACTION action;
    void* context;
};

bool PassTicket(void* place, int type, int id, STICKET_ACCESS const* ticket)
{
    auto const& walk = *static_cast<TICKETS*>(place);
    bool goesOn = walk.action(walk.context, type, id, Has("walk-without-table") ? nullptr : ticket);
    if (Has("tickets-double"))
        goesOn = walk.action(walk.context, type, id, ticket);
    return goesOn || Has("tickets-go-on");
}

int WalkTickets(void* instance, MWALKTICKETS_ACTION action, void* context, int type)
{
    TICKETS walk{action, context};
    return realContainer.MWALKTICKETS(instance, PassTicket, &walk, type);
}

STICKET_ACCESS const* CreateTicket(void* instance, int type, int id, char const* const* keys)
{
    STICKET_ACCESS const* const ticket = realContainer.MCREATETICKET(instance, type, id, keys);
    if (Has("created-elsewhere") && ticket)
        return realContainer.MCREATETICKET(instance, type, id - 1, keys);
    return ticket;
}

// --- notifications

using CALLBACK = void (*)(void*, int, int, int, int, void*);
struct HEARER
{
    CALLBACK callback;
    void* user;
    std::function<void()> held{};
};

void Report(HEARER& hearer, int kind, int a, int b, int code, SETMULTIPAR* records)
{
    std::vector<SETMULTIPAR> copy;
    std::deque<std::string> keys;
    for (SETMULTIPAR const* record = records; Has("key-pointers") && record && record->key; ++record)
    {
        copy.push_back(*record);
        keys.push_back(record->key);
        copy.back().key = keys.back().c_str();
    }
    copy.push_back({});
    void* const user = Has("other-user") ? &hearer : hearer.user;
    hearer.callback(user, Has("other-kind") && kind == 1 ? 2 : kind, a, b, code,
                    Has("key-pointers") && records ? copy.data() : static_cast<void*>(records));
}

// Numbers in pairs, the later first.
void Callback(void* place, int kind, int a, int b, int code, void* data)
{
    auto& hearer = *static_cast<HEARER*>(place);
    auto* const records = static_cast<SETMULTIPAR*>(data);
    bool const isNumber = kind == 1 && records && records->key && Ends(records->key, "Number");
    if (Has("order-turned") && isNumber && !hearer.held)
    {
        static std::string key;
        static int number;
        key = records->key;
        number = *static_cast<int const*>(records->value);
        hearer.held = [&hearer, a, b, code]
        {
            SETMULTIPAR late[2]{{key.c_str(), PARAM_INT, 0, &number, -1, true, {}}, {}};
            Report(hearer, 1, a, b, code, late);
        };
        return;
    }
    Report(hearer, kind, a, b, code, records);
    if (hearer.held)
        std::exchange(hearer.held, nullptr)();
}

int Register(void* instance, void* session, char const* command, void* data)
{
    static std::deque<HEARER> hearers;
    auto const* const ticket = static_cast<STICKET_ACCESS const*>(data);
    HEARER hearer{};
    void* callback = nullptr;
    ticket->SGETPARAMETER(ticket->Instance, "pGUI2Notification", PARAM_POINTER, &callback, -1);
    ticket->SGETPARAMETER(ticket->Instance, "pUser", PARAM_POINTER, &hearer.user, -1);
    hearer.callback = reinterpret_cast<CALLBACK>(callback);
    hearers.push_back(hearer);
    CALLBACK const own = Callback;
    ticket->SSETPARAMETER(ticket->Instance, "pGUI2Notification", PARAM_POINTER, reinterpret_cast<void*>(own),
                          -1);
    ticket->SSETPARAMETER(ticket->Instance, "pUser", PARAM_POINTER, &hearers.back(), -1);
    int const code = real.SendCommandEntry(instance, session, command, 0, data);
    int const none = -7;
    if (Has("register-no-id"))
        ticket->SSETPARAMETER(ticket->Instance, "iGUINotificationID", PARAM_INT, &none, -1);
    return Has("register-code") ? 9 : code;
}

int Switch(void* instance, int type, int id, int notification, bool isOn, char const* const* keys)
{
    static std::map<std::pair<int, int>, int> offs;
    static char const* const none[] = {nullptr};
    if (Has("keys-ignored") && isOn)
        keys = none;
    if (Has("keys-kept") && isOn && keys[0])  // to be looked at later
        std::thread(
            [=]
            {
                std::this_thread::sleep_for(std::chrono::milliseconds(20));
                char const* const first = keys[0] ? keys[0] : "nothing";
                char const* const copy[] = {first, nullptr};
                realContainer.MENDISNOTIF(instance, type, id, notification, true, copy);
            })
            .detach();
    if (Has("off-does-nothing") && !isOn)
        return 1;
    std::lock_guard const held(lock);
    if (!isOn && notification >= 0)
        ++offs[{type, id}];
    if (Has("off-twice-breaks") && isOn && offs[{type, id}] > 1)
        return 1;
    return realContainer.MENDISNOTIF(instance, type, id, notification, isOn, keys);
}

// --- the container itself

MTICKET_ACCESS const* GetClientContainer(void* instance, void* session)
{
    static std::deque<MTICKET_ACCESS> containers;
    if (Has("null-handle-crash") && !session)
        return *static_cast<MTICKET_ACCESS const* volatile*>(session);
    MTICKET_ACCESS const* const container = real.GetClientContainerEntry(instance, session);
    if (!container || Has("no-container"))
        return nullptr;
    std::lock_guard const held(lock);
    realContainer = *container;
    if (Has("container-moves"))
        for (MTICKET_ACCESS& old : containers)
            old.Instance = nullptr;
    containers.push_back(*container);
    MTICKET_ACCESS& copy = containers.back();
    copy.MGETPARAMETER = Get;
    copy.MSETPARAMETER = Set;
    copy.MGETMULTIPAR = GetTable;
    copy.MSETMULTIPAR = SetTable;
    copy.MOPERATION = Operation;
    copy.MWALKTICKETS = WalkTickets;
    copy.MENDISNOTIF = Switch;
    copy.MCREATETICKET = CreateTicket;
    if (Has("slot-null"))
        copy.MWALKTICKETS = nullptr;
    return &copy;
}

// --- commands

int SendCommand(void* instance, void* session, char const* command, int size, void* data)
{
    std::string_view const name = command;
    if (Has("null-handle-succeeds") && !session)
        return 0;
    if (name == "local.set.callback" && session)
        return Register(instance, session, command, data);
    if (Has("folder-reads-on") && name.ends_with("folder"))
        size = static_cast<int>(std::strlen(static_cast<char const*>(data)));
    int const code = real.SendCommandEntry(instance, session, command, size, data);
    auto* const record = size == sizeof(TCommandRecord) ? static_cast<TCommandRecord*>(data) : nullptr;
    if (Has("alive-says-no") && name == "remote.system.isalive" && code == 0)
        record->iResult = -1;
    if (Has("record-renamed") && record && code == 0)
        record->nMagic = 0;
    if (Has("prepare-says-no") && name == "remote.job.prepare" && code == 0)
        record->iResult = -1;
    return Has("unknown-command-succeeds") && session ? 0 : code;
}

int GetTicketData(void* instance, void* session, int type, int id, int form, int* size, void* buffer)
{
    if (Has("ticket-data-overruns") && buffer && size && session)
        std::memset(buffer, 'x', static_cast<std::size_t>(*size) + 8);
    return real.GetTicketDataEntry(instance, session, type, id, form, size, buffer);
}

// --- files

int GetFileSync(void* instance, void* session, char* server, char* local)
{
    int const code = real.GetFileSyncEntry(instance, session, server, local);
    if (Has("fetched-differs") && code == 0)
        std::ofstream(local, std::ios::app) << "more";
    return code;
}

int PutFileSync(void* instance, void* session, char* local, char* server)
{
    int const code = real.PutFileSyncEntry(instance, session, local, server);
    return Has("missing-file-sent") && session ? 0 : code;
}

int PutFile(void* instance, void* session, char* local, char* server)
{
    return Has("put-never") && session ? 0 : real.PutFileEntry(instance, session, local, server);
}

int GetFile(void* instance, void* session, char* server, char* local)
{
    if (!Has("transfer-keeps") || !session)
        return real.GetFileEntry(instance, session, server, local);
    std::thread(
        [=]
        {
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
            real.GetFileEntry(instance, session, server, local);
        })
        .detach();
    return 0;
}

int SendJob(void* instance, void* session, TJobIdentification* job, char* path, char* name)
{
    int const code = real.SendJobEntry(instance, session, job, path, name);
    return Has("job-refused") && code == 0 ? 5 : code;
}

// --- the ticket factory

int MemorySet(void* instance, char const* key, PARAM_TYPE type, void const* value, int position);
std::map<STICKET_ACCESS const*, STICKET_ACCESS const*> memory;  // the copy, and the real one
STICKET_ACCESS realMemory;

int MemorySet(void* instance, char const* key, PARAM_TYPE type, void const* value, int position)
{
    if (Has("memory-no-pointers") && type == PARAM_POINTER)
        return 0;
    if (Has("memory-appends-nothing") && position == -2)
        return 1;
    return realMemory.SSETPARAMETER(instance, key, type, value, position);
}

int MemoryWalk(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
{
    WALK walk{action, context};
    if (!Has("memory-walk-skips"))
        return realMemory.SWALKPARAMETERS(instance, action, context, prefix, limit);
    return realMemory.SWALKPARAMETERS(
        instance,
        [](void* place, char const* key, PARAM_TYPE type, void const* word, int position)
        {
            auto& here = *static_cast<WALK*>(place);
            return here.calls++ == 0 || here.action(here.context, key, type, word, position);
        },
        &walk, prefix, limit);
}

STICKET_ACCESS const* MakeTicket(char const* path)
{
    std::lock_guard const held(lock);
    STICKET_ACCESS const* ticket = real.STicketFactory->CreateTicket(path);
    if ((Has("missing-file-made") && !ticket) || (Has("file-not-saved") && path))
        ticket = real.STicketFactory->CreateTicket(nullptr);
    if (Has("file-not-opened") && path)
        return nullptr;
    if (!ticket)
        return nullptr;
    int const one = 1;
    if (Has("memory-not-empty") && !path)
        ticket->SSETPARAMETER(ticket->Instance, "Left", PARAM_INT, &one, -1);
    static STICKET_ACCESS const* first = nullptr;
    if (Has("memory-shared") && !path && first)
        return first;
    realMemory = *ticket;
    auto* const copy = new STICKET_ACCESS(*ticket);
    copy->SSETPARAMETER = MemorySet;
    copy->SWALKPARAMETERS = MemoryWalk;
    memory[copy] = ticket;
    first = copy;
    return copy;
}

void DestroyTicket(STICKET_ACCESS const** ticket)
{
    std::lock_guard const held(lock);
    auto const found = memory.find(*ticket);
    if (found == memory.end() || Has("memory-shared"))
        return;
    STICKET_ACCESS const* own = found->second;
    real.STicketFactory->DestroyTicket(&own);
    memory.erase(found);
    static STICKET_ACCESS const other{};
    *ticket = Has("destroy-leaves-another") ? &other : nullptr;
}

// --- all together

bool LoadReal(CFAllocatorRef allocator, CFUUIDRef type)
{
    using FACTORY = void* (*)(CFAllocatorRef, CFUUIDRef);
    void* const library = dlopen(COMGUI_REAL_MODULE, RTLD_NOW | RTLD_LOCAL);
    auto const make = library ? reinterpret_cast<FACTORY>(dlsym(library, "ComGUIModuleFactory")) : nullptr;
    void* const object = make ? make(allocator, type) : nullptr;
    if (!object)
        return false;
    real = **static_cast<ComGUIModuleInterface**>(object);
    table = real;
    table.QueryInterface = QueryInterface;
    table.Release = Release;
    table.Open = Open;
    table.IsAliveEntry = IsAlive;
    table.GetLocalAddressEntry = GetLocalAddress;
    table.InitializeEntry = Initialize;
    table.LoginEntry = Login;
    table.LogoutEntry = Logout;
    table.UninitializeEntry = Uninitialize;
    table.GetClientContainerEntry = GetClientContainer;
    table.SendCommandEntry = SendCommand;
    table.GetTicketDataEntry = GetTicketData;
    table.GetFileSyncEntry = GetFileSync;
    table.PutFileSyncEntry = PutFileSync;
    table.PutFileEntry = PutFile;
    table.GetFileEntry = GetFile;
    table.SendJobEntry = SendJob;
    factory = *real.STicketFactory;
    factory.CreateTicket = MakeTicket;
    factory.DestroyTicket = DestroyTicket;
    table.STicketFactory = Has("factory-null") ? nullptr : &factory;
    if (Has("entry-null"))
        table.UninitializeAsyncEntry = nullptr;
    return true;
}
}  // namespace

void* FaultyModuleFactory(CFAllocatorRef allocator, CFUUIDRef type)
{
    static bool const isLoaded = LoadReal(allocator, type);
    return isLoaded && !Has("no-object") ? &interface : nullptr;
}
