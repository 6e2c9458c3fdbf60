// What host, library and plug-in know of one session, in a layout that all three share. Texts are UTF-8 and
// end with a zero byte, so 127 bytes fit; a longer one is cut there, and if that splits a character it reads
// as empty afterwards.
//
// Memory: a record given to ComGUIManager::Login(TLogin*) becomes the manager's, which frees it with free().
// So make such a record with calloc, never with new and never on the stack, and set nSize:
//
//     TLogin* login = static_cast<TLogin*>(calloc(1, sizeof(TLogin)));
//     login->nSize = sizeof(TLogin);
#pragma once

#include <cstddef>
#include <type_traits>

struct TLogin
{
    unsigned int nSize;  // always 2632
    char szUser[128];
    char szPassword[128];       // carried to the plug-in unread
    char szLocalAddress[128];   // dotted IPv4, as the last test of the server found it
    unsigned int iLocalPort;    // the local port that this session was given
    char szLocalEndPoint[128];  // names this client's end point; filled in by the plug-in at login
    char szServerHost[128];     // name or address
    int iServerPort;
    char reserved652[132];   // the plug-in's
    void* hSession;          // the plug-in's handle of the session; null before login
    int iClientStamp;        // going in: the client's stamp; after login: the user's ticket id
    int iUserRole;           // 16 and nothing else is an administrator
    int iReserved800;        // 0
    char reserved804[20];    // the plug-in's
    int iGUINotificationID;  // id of this session's notifications; -1 or 0 when there is none
    char reserved828[1804];  // the plug-in's
};
static_assert(std::is_standard_layout_v<TLogin> && std::is_trivial_v<TLogin> && sizeof(TLogin) == 2632);
static_assert(offsetof(TLogin, nSize) == 0);
static_assert(offsetof(TLogin, szUser) == 4);
static_assert(offsetof(TLogin, szPassword) == 132);
static_assert(offsetof(TLogin, szLocalAddress) == 260);
static_assert(offsetof(TLogin, iLocalPort) == 388);
static_assert(offsetof(TLogin, szLocalEndPoint) == 392);
static_assert(offsetof(TLogin, szServerHost) == 520);
static_assert(offsetof(TLogin, iServerPort) == 648);
static_assert(offsetof(TLogin, reserved652) == 652);
static_assert(offsetof(TLogin, hSession) == 784);
static_assert(offsetof(TLogin, iClientStamp) == 792);
static_assert(offsetof(TLogin, iUserRole) == 796);
static_assert(offsetof(TLogin, iReserved800) == 800);
static_assert(offsetof(TLogin, reserved804) == 804);
static_assert(offsetof(TLogin, iGUINotificationID) == 824);
static_assert(offsetof(TLogin, reserved828) == 828);
