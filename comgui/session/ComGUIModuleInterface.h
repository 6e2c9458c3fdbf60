// What the plug-in offers: 44 words behind the interface pointer, of which ComGUIManager keeps a copy. They
// begin with the four that every CFPlugIn has. The words never change, as some entries are called through the
// copy and others through the plug-in's own table; none of those that have a name is null. hInstance comes
// from Open, hSession from the record that was logged in; an entry that gets null or the handle of a session
// that has ended fails. An entry without a word on its result gives 0 for success or a code of its own, and
// the host gets to see that number. Records and texts stay the host's and are not kept beyond the call,
// except for the TLogin, which stays where it is from InitializeEntry to the logout. Entries are called on
// the host's thread, whichever that is. The library has nothing that would catch an exception.
// docs/module-contract.md numbers these rules.
#pragma once

#include "comgui/session/STicketFactory.h"
#include "comgui/session/TLogin.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <cstddef>
#include <type_traits>

struct TJobIdentification;

// What the plug-in's bundle is called, and the UUIDs under which it is found.
#define COMGUI_BUNDLE_NAME "ComGUI.Bundle"
#define COMGUI_PLUGIN_TYPE_UUID "5CDEF0B8-6CFC-11D8-A365-003065B1346E"
#define COMGUI_INTERFACE_UUID "33FC3B14-6CFF-11D8-AB09-003065B1346E"

// The 16 bytes of a UUID in the order of its text. Passed by value, laid out as CFUUIDBytes.
struct COMGUI_UUID
{
    unsigned char bytes[16];
};

struct ComGUIModuleInterface
{
    void* _reserved;

    // Puts the interface pointer (ComGUIModuleInterface**) for COMGUI_INTERFACE_UUID into *out, and for any
    // other leaves it. The pointer holds a reference of its own: it outlives Release, to the end of the
    // process.
    int (*QueryInterface)(void* instance, COMGUI_UUID interfaceId, void** out);
    unsigned int (*AddRef)(void* instance);   // never called here
    unsigned int (*Release)(void* instance);  // gives back what the factory made

    // Makes the module's instance, stores its handle and gives 0. The one entry without an instance argument.
    int (*Open)(void** hInstance);
    void* reserved40;

    // Makes the record ready for a login and leaves what the host has filled in. stamp: as in iClientStamp.
    // After a logout the same record may come again.
    int (*InitializeEntry)(void* hInstance, TLogin* login, int stamp);

    // 0: a server answers there. Needs no record and no login.
    int (*IsAliveEntry)(void* hInstance, char const* host, int port);

    // Not a code but the IPv4 address by which this machine reaches that host, first octet in the top byte.
    // Also called if no server has answered.
    unsigned int (*GetLocalAddressEntry)(void* hInstance, char const* host, int port);

    // Makes a session of the record's user: stores hSession, iClientStamp (the id of the user's ticket),
    // iUserRole (16: administrator) and szLocalEndPoint, and leaves the other fields. Sessions at once are
    // not limited, not even for one user. A record that has not been initialised gets a code or a session.
    int (*LoginEntry)(void* hInstance, TLogin* login);

    // Ends that session alone. The handle is worth nothing afterwards, and no callback of the session begins.
    int (*LogoutEntry)(void* hInstance, void* hSession);
    int (*UninitializeEntry)(void* hInstance, TLogin* login);  // the record itself, not its handle

    // Null for a session without tickets. The plug-in keeps owning it, until the logout, and gives the same
    // again.
    MTICKET_ACCESS const* (*GetClientContainerEntry)(void* hInstance, void* hSession);

    // A ticket's data into a buffer of the caller; what the five values say is the plug-in's to define.
    int (*GetTicketDataEntry)(void* hInstance, void* hSession, int, int, int, int*, void*);
    void* reserved112[2];

    // Carries out the command of that name. data: its record (a TCommandRecord keeps nMagic and nSize, and
    // gets its answer in iResult) or text, of size bytes without a terminator. A command that is not known
    // fails.
    int (*SendCommandEntry)(void* hInstance, void* hSession, char const* command, int size, void* data);
    // Send and fetch a file, and send a job: paths and names are UTF-8. Which of the two char* of a file is
    // the local side is the plug-in's to define. A local file that does not exist is a failure. The Sync
    // forms wait for the end, the others need not.
    int (*PutFileEntry)(void* hInstance, void* hSession, char*, char*);
    int (*GetFileEntry)(void* hInstance, void* hSession, char*, char*);
    int (*SendJobEntry)(void* hInstance, void* hSession, TJobIdentification*, char* path, char* name);
    int (*PutFileSyncEntry)(void* hInstance, void* hSession, char*, char*);

    ::STicketFactory* STicketFactory;  // data, not a function; works without a session
    void* reserved176[2];

    int (*GetFileSyncEntry)(void* hInstance, void* hSession, char*, char*);
    int (*UninitializeAsyncEntry)(void* hInstance, TLogin* login);  // need not wait for the work to end
    void* reserved208[18];
};
static_assert(std::is_standard_layout_v<ComGUIModuleInterface> && sizeof(ComGUIModuleInterface) == 352);
static_assert(offsetof(ComGUIModuleInterface, _reserved) == 0);
static_assert(offsetof(ComGUIModuleInterface, QueryInterface) == 8);
static_assert(offsetof(ComGUIModuleInterface, AddRef) == 16);
static_assert(offsetof(ComGUIModuleInterface, Release) == 24);
static_assert(offsetof(ComGUIModuleInterface, Open) == 32);
static_assert(offsetof(ComGUIModuleInterface, reserved40) == 40);
static_assert(offsetof(ComGUIModuleInterface, InitializeEntry) == 48);
static_assert(offsetof(ComGUIModuleInterface, IsAliveEntry) == 56);
static_assert(offsetof(ComGUIModuleInterface, GetLocalAddressEntry) == 64);
static_assert(offsetof(ComGUIModuleInterface, LoginEntry) == 72);
static_assert(offsetof(ComGUIModuleInterface, LogoutEntry) == 80);
static_assert(offsetof(ComGUIModuleInterface, UninitializeEntry) == 88);
static_assert(offsetof(ComGUIModuleInterface, GetClientContainerEntry) == 96);
static_assert(offsetof(ComGUIModuleInterface, GetTicketDataEntry) == 104);
static_assert(offsetof(ComGUIModuleInterface, reserved112) == 112);
static_assert(offsetof(ComGUIModuleInterface, SendCommandEntry) == 128);
static_assert(offsetof(ComGUIModuleInterface, PutFileEntry) == 136);
static_assert(offsetof(ComGUIModuleInterface, GetFileEntry) == 144);
static_assert(offsetof(ComGUIModuleInterface, SendJobEntry) == 152);
static_assert(offsetof(ComGUIModuleInterface, PutFileSyncEntry) == 160);
static_assert(offsetof(ComGUIModuleInterface, STicketFactory) == 168);
static_assert(offsetof(ComGUIModuleInterface, reserved176) == 176);
static_assert(offsetof(ComGUIModuleInterface, GetFileSyncEntry) == 192);
static_assert(offsetof(ComGUIModuleInterface, UninitializeAsyncEntry) == 200);
static_assert(offsetof(ComGUIModuleInterface, reserved208) == 208);
