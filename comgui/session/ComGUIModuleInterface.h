// What the plug-in offers: 44 words behind the interface pointer, of which ComGUIManager keeps a copy. They
// begin with the four that every CFPlugIn has. hInstance comes from Open, hSession from the record that was
// logged in. An entry without a word on its result gives 0 for success or a code of its own, and the host
// gets to see that number. The library has nothing that would catch an exception.
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

    // Puts the interface pointer (ComGUIModuleInterface**) for COMGUI_INTERFACE_UUID into *out, or leaves it.
    int (*QueryInterface)(void* instance, COMGUI_UUID interfaceId, void** out);
    unsigned int (*AddRef)(void* instance);   // never called here
    unsigned int (*Release)(void* instance);  // gives back what the factory made

    // Makes the module's instance and stores its handle. The one entry without an instance argument.
    int (*Open)(void** hInstance);
    void* reserved40;

    // Makes the record ready for a login, and may fill in what it likes. stamp: as in iClientStamp.
    int (*InitializeEntry)(void* hInstance, TLogin* login, int stamp);

    int (*IsAliveEntry)(void* hInstance, char const* host, int port);  // 0: a server answers there

    // Not a code but an IPv4 address, first octet in the top byte.
    unsigned int (*GetLocalAddressEntry)(void* hInstance, char const* host, int port);

    // Makes a session of the record's user; hSession, iClientStamp, iUserRole and szLocalEndPoint tell of it.
    int (*LoginEntry)(void* hInstance, TLogin* login);
    int (*LogoutEntry)(void* hInstance, void* hSession);       // the handle is worth nothing afterwards
    int (*UninitializeEntry)(void* hInstance, TLogin* login);  // the record itself, not its handle

    // Null for a session without one. The plug-in keeps owning it.
    MTICKET_ACCESS const* (*GetClientContainerEntry)(void* hInstance, void* hSession);

    // A ticket's data into a buffer of the caller; the plug-in knows what the five values say.
    int (*GetTicketDataEntry)(void* hInstance, void* hSession, int, int, int, int*, void*);
    void* reserved112[2];

    // Carries out the command of that name. data: its record or text, of size bytes.
    int (*SendCommandEntry)(void* hInstance, void* hSession, char const* command, int size, void* data);
    // Send and fetch a file, and send a job: paths and names are UTF-8. The plug-in knows which of the two
    // char* of a file is the local side. The Sync forms wait for the end.
    int (*PutFileEntry)(void* hInstance, void* hSession, char*, char*);
    int (*GetFileEntry)(void* hInstance, void* hSession, char*, char*);
    int (*SendJobEntry)(void* hInstance, void* hSession, TJobIdentification*, char* path, char* name);
    int (*PutFileSyncEntry)(void* hInstance, void* hSession, char*, char*);

    ::STicketFactory* STicketFactory;  // data, not a function
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
