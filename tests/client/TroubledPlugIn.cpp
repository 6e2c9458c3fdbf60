#include "tests/client/TroubledPlugIn.h"

#include "comgui/session/ComGUIModuleInterface.h"
#include <CoreFoundation/CoreFoundation.h>
#include <chrono>
#include <cstring>
#include <dlfcn.h>
#include <mutex>
#include <set>
#include <string_view>
#include <thread>

extern "C"
{
    __attribute__((visibility("default"))) TROUBLE TroubledPlugInOrders;
    __attribute__((visibility("default"))) void* TroubledPlugInFactory(CFAllocatorRef, CFUUIDRef);
}

namespace
{
TROUBLE& trouble = TroubledPlugInOrders;

ComGUIModuleInterface real;
ComGUIModuleInterface table;
ComGUIModuleInterface* interface = &table;

int QueryInterface(void*, COMGUI_UUID, void** out)
{
    *out = &interface;
    return 0;
}
unsigned int Release(void*) { return 1; }

int IsAlive(void* hInstance, char const* host, int port)
{
    return trouble.serverIsAway ? 105 : real.IsAliveEntry(hInstance, host, port);
}

void Take(std::atomic<int> const& time) { std::this_thread::sleep_for(std::chrono::milliseconds(time)); }

// The sessions that have ended.
std::mutex endedLock;
std::set<void*> ended;

bool HasEnded(void* hSession)
{
    std::lock_guard const lock(endedLock);
    return ended.count(hSession) != 0;
}

int Login(void* hInstance, TLogin* login)
{
    trouble.newest = login;
    ++trouble.tries;
    Take(trouble.loginTakes);
    if (trouble.loginsAreRefused)
        return 42;
    int const code = real.LoginEntry(hInstance, login);
    if (code == 0)
    {
        trouble.sessionIsGone = false;
        ++trouble.logins;
        std::lock_guard const lock(endedLock);
        ended.erase(login->hSession);
    }
    return code;
}

int Logout(void* hInstance, void* hSession)
{
    Take(trouble.logoutTakes);
    ++trouble.logouts;
    {
        std::lock_guard const lock(endedLock);
        ended.insert(hSession);
    }
    return real.LogoutEntry(hInstance, hSession);
}

int PutFileSync(void* hInstance, void* hSession, char* source, char* target)
{
    ++trouble.puts;
    for (int time = 0; time < trouble.putTakes && !HasEnded(hSession); ++time)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    return real.PutFileSyncEntry(hInstance, hSession, source, target);
}

int GetTicketData(void* hInstance, void* hSession, int type, int id, int form, int* size, void* data)
{
    ++trouble.ticketData;
    Take(trouble.ticketDataTakes);
    return real.GetTicketDataEntry(hInstance, hSession, type, id, form, size, data);
}

MTICKET_ACCESS const* GetClientContainer(void* hInstance, void* hSession)
{
    return trouble.hasNoContainer
               ? nullptr
               : Troubled(real.GetClientContainerEntry(hInstance, hSession), trouble.tickets);
}

int AnswerProgress(void* data)
{
    auto const* const ticket = static_cast<STICKET_ACCESS const*>(data);
    long long const done = 1LL * trouble.progress * trouble.progressGrows;
    long long const size = 1000000;
    ticket->SSETPARAMETER(ticket->Instance, "Transfer/Done", GetParamType<long long>(), &done, -1);
    ticket->SSETPARAMETER(ticket->Instance, "Transfer/Size", GetParamType<long long>(), &size, -1);
    return 0;
}

void NoteCallback(STICKET_ACCESS const& ticket)
{
    void* callback = nullptr;
    void* user = nullptr;
    ticket.SGETPARAMETER(ticket.Instance, "pGUI2Notification", PARAM_POINTER, &callback, -1);
    ticket.SGETPARAMETER(ticket.Instance, "pUser", PARAM_POINTER, &user, -1);
    trouble.callbackUser = user;
    trouble.callback = reinterpret_cast<void (*)(void*, int, int, int, int, void*)>(callback);
}

int SendCommand(void* hInstance, void* hSession, char const* command, int size, void* data)
{
    std::string_view const name = command;
    if (name == "remote.system.isalive")
    {
        ++trouble.questions;
        Take(trouble.questionTakes);
    }
    if (name == "local.get.progress")
    {
        ++trouble.progress;
        Take(trouble.progressTakes);
        if (trouble.progressGrows != 0)
            return AnswerProgress(data);
    }
    if (name == "remote.system.isalive" && trouble.serverIsAway)
        return 106;
    if (name == "remote.system.isalive" && trouble.sessionIsGone)
        return 103;
    if (name == "local.set.callback" && trouble.refusesCallbacks)
        return 101;
    if (name == "local.set.callback" && !trouble.callback)
        NoteCallback(*static_cast<STICKET_ACCESS const*>(data));
    if (name.substr(0, 10) == "local.get." && trouble.knowsNoNewCommands)
        return 111;
    return real.SendCommandEntry(hInstance, hSession, command, size, data);
}

bool LoadReal(CFAllocatorRef allocator, CFUUIDRef type)
{
    void* const module = dlopen(COMGUI_REAL_MODULE, RTLD_NOW | RTLD_LOCAL);
    auto const factory =
        module ? reinterpret_cast<void* (*)(CFAllocatorRef, CFUUIDRef)>(dlsym(module, COMGUI_REAL_FACTORY))
               : nullptr;
    void* const instance = factory ? factory(allocator, type) : nullptr;
    if (!instance)
        return false;
    // The plug-in's interface is its instance, too: the first word points at the table.
    std::memcpy(&real, *static_cast<void**>(instance), sizeof real);
    table = real;
    table.QueryInterface = QueryInterface;
    table.Release = Release;
    table.IsAliveEntry = IsAlive;
    table.LoginEntry = Login;
    table.LogoutEntry = Logout;
    table.PutFileSyncEntry = PutFileSync;
    table.GetTicketDataEntry = GetTicketData;
    table.GetClientContainerEntry = GetClientContainer;
    table.SendCommandEntry = SendCommand;
    return true;
}
}  // namespace

void* TroubledPlugInFactory(CFAllocatorRef allocator, CFUUIDRef type)
{
    static bool const isLoaded = LoadReal(allocator, type);
    return isLoaded ? &interface : nullptr;
}
