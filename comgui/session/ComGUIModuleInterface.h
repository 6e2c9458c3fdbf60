// The plug-in's table of entries: 44 words, 352 bytes, copied whole by ComGUIManager when it starts. The
// first four are the header of every CFPlugIn. hInstance is what Open gave out, hSession the handle in
// TLogin. A result is 0 for success unless told otherwise, and reaches the manager's caller untouched. No
// entry may throw, and none may keep a pointer it was given beyond its return, except where told.
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

    // Prepares a session for this record and fills in what the plug-in needs there. stamp is the value of
    // iClientStamp.
    int (*InitializeEntry)(void* hInstance, TLogin* login, int stamp);

    int (*IsAliveEntry)(void* hInstance, char const* host, int port);  // 0: a server answers there

    // Not a code: the IPv4 address of this machine as the server sees it, first octet in the top byte.
    unsigned int (*GetLocalAddressEntry)(void* hInstance, char const* host, int port);

    // Fills in hSession, iClientStamp, iUserRole and szLocalEndPoint.
    int (*LoginEntry)(void* hInstance, TLogin* login);
    int (*LogoutEntry)(void* hInstance, void* hSession);
    int (*UninitializeEntry)(void* hInstance, TLogin* login);  // the record itself, not its handle

    // The session's container, owned by the plug-in; null if there is none.
    MTICKET_ACCESS const* (*GetClientContainerEntry)(void* hInstance, void* hSession);

    // Fills the caller's buffer with a ticket's data; what the five values are is the plug-in's to say.
    int (*GetTicketDataEntry)(void* hInstance, void* hSession, int, int, int, int*, void*);
    void* reserved112[2];

    int (*SendCommandEntry)(void* hInstance, void* hSession, char const* command, int size, void* data);
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
