// The session manager: opens the communication plug-in, carries the sessions with the server, and leads
// the host's calls to the plug-in's entries and to the slots of its ticket containers.
//
// Three families of calls share one plug-in:
//   implicit  (no TLogin*)       works on the manager's own record; the plain way for one session
//   explicit  (TLogin* first)    works on the caller's record; shares flags and counter with the implicit one
//   Backward                     a second, independent session with its own record, flags and counter
//
// Results are 0 for success unless told otherwise, and any other code of the plug-in is passed on as it is.
// The library's own codes: -1 not logged in, or no container; -2005 server not reachable; -9999 see
// GetServerName. Reads and writes of parameters count the other way round: not zero is success.
//
// Threads: nothing here locks. One thread at a time, and the first GetInstance() before any other thread
// can call it.
//
// A manager that could not open its plug-in is usable as far as an operation needs none; it said so on
// stderr and left hSTicketInstance null. Operations that need the plug-in then fault: they test nothing.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/session/ComGUIModuleInterface.h"
#include "comgui/session/TLogin.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/STRINGCACHE.h"
#include <list>
#include <wx/arrstr.h>
#include <wx/dynarray.h>
#include <wx/list.h>
#include <wx/string.h>
#include <wx/thread.h>

struct __CFBundle;
class NotifData;
class clFOLDER_VARIABLES;

class COMGUI_EXPORT ComGUIManager
{
public:
    // The one manager of the process, made and never deleted by the library. The first call opens the
    // plug-in; one that fails is not repeated.
    static ComGUIManager* GetInstance();

    // Opens the plug-in as the first GetInstance() does. Hosts call GetInstance().
    ComGUIManager();

    // Frees the record of the implicit session. Calls nothing of the plug-in, which stays loaded.
    ~ComGUIManager();

    ComGUIManager(ComGUIManager const&) = delete;
    ComGUIManager& operator=(ComGUIManager const&) = delete;

    // Steps of the construction. RegisterPlugIn opens the bundle where the host keeps its plug-ins and
    // stores it, null included, in *plugIn. CreateComGUIModuleInterface makes an instance of the plug-in's
    // first factory and stores its interface in *module, which the caller has set to null before. 0 or -1.
    int RegisterPlugIn(__CFBundle** plugIn);
    int CreateComGUIModuleInterface(__CFBundle* plugIn, ComGUIModuleInterface*** module);

    // Does nothing, on purpose: the plug-in stays loaded to the end of the process.
    void FreeDll();

    // --- Preparing a session -----------------------------------------------------------------------------
    // Takes a local port and hands the record to the plug-in. Nothing happens, and the result is 0, if the
    // family is initialised already. Texts are UTF-8 and cut at 127 bytes; null counts as empty.
    // stamp: the host's client stamp; stored in the record even when nothing else happens.
    int Initialize(char const* user, char const* password, char const* host, int port);
    int Initialize(TLogin* login, int stamp);
    int InitializeBackward(TLogin* login, int stamp);

    // --- Logging in --------------------------------------------------------------------------------------
    // A null text, and a port of -1, keep what the record holds. Fetches the session's container too.
    int Login(char const* user, char const* password, char const* host, int port);

    // Logs the implicit record in and fetches its container; touches no flag, so that guarded operations go
    // on answering as before.
    int MacLogin();

    // The record becomes the manager's, which frees it with free(): see TLogin.h. That holds when the login
    // fails, too; the record of before is not freed. The container is not fetched: GetClientContainer().
    int Login(TLogin* login);

    // The record stays the caller's.
    int LoginBackward(TLogin* login);

    // --- Ending a session --------------------------------------------------------------------------------
    // The family's flags go down before the plug-in is asked, whatever it answers. The container that the
    // manager holds is not cleared.
    int Logout();
    int Logout(TLogin* login);
    int LogoutBackward(TLogin* login);

    // Both forms block for 4 seconds after the plug-in has answered, the Async ones just as long.
    int Uninitialize();
    int Uninitialize(TLogin* login);
    int UninitializeAsync();
    int UninitializeAsync(TLogin* login);

    // --- Testing a server --------------------------------------------------------------------------------
    // Needs no session. 0, with szLocalAddress filled in, or -2005 with the record left alone.
    int IsAlive(TLogin* login);
    bool IsServerOnline(TLogin* login);

    // The same for the Backward session, which does not trust the record's port: it reads the port from the
    // system ticket's file, "tickets\\SYS_0000.xml" in the current folder, and keeps it in the record and as
    // the next local port of InitializeBackward. -1 where there is no such file.
    int IsAliveBackward(TLogin* login);

    // --- Containers --------------------------------------------------------------------------------------
    // Owned by the plug-in; null if there is none. GetClientContainer keeps the result for the session
    // forms below, unless it is null.
    MTICKET_ACCESS const* GetClientContainer();
    MTICKET_ACCESS const* GetBackwardContainer();
    MTICKET_ACCESS const* GetHandleToClientContainer(TLogin* login);

    // --- Questions: answered from local state, the plug-in is not asked ----------------------------------
    wxString GetServerName() const;          // empty: nothing sets it
    int GetServerName(TLogin* login) const;  // always -9999, whatever the argument
    wxString GetLocalEndPoint() const;
    wxString GetCurrentlyLoggedUser() const;
    wxString GetCurrentlyLoggedUser(TLogin* login) const;
    int GetCurrentlyLoggedUserTicketID() const;  // before login: the stamp
    bool IsCurrentUserAdmin() const;
    bool IsCurrentUserAdmin(TLogin* login) const;
    wxString GetUserLockInfo() const;  // "http://<local address>:<local port>"
    wxString GetUserLockInfo(TLogin* login) const;
    bool IsServerLocal() const;
    bool IsServerLocal(TLogin* login) const;  // ignores the letter case of the local address, too
    bool IsTernServerLocal() const;           // "ComGUISrv.Dll" lies in the current folder
    int GetEndian() const;                    // always 0x49494949, the bytes "IIII"

    // --- Parameters of tickets ---------------------------------------------------------------------------
    // Without a container argument: of the implicit session's container. type and id name the ticket, key
    // and text values are UTF-8, value is what PARAM_TYPE.h says, pos is -1 for the key as a whole or the
    // index of a value. -1 when the implicit session is not logged in, also where the container is another
    // session's; else the slot's result, not zero for success. A text that is read belongs to the module.
    int GetParameter(int type, int id, char const* key, PARAM_TYPE ptype, void* value, int pos);
    int GetParameter(MTICKET_ACCESS const* container, int type, int id, char const* key, PARAM_TYPE ptype,
                     void* value, int pos);  // -1 for a null container
    int SetParameter(int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos);
    int SetParameter(MTICKET_ACCESS const* container, int type, int id, char const* key, PARAM_TYPE ptype,
                     void const* value, int pos);  // the container must not be null

    // Of the system ticket, logged in or not. There must be a container.
    int GetSystemTicketParamForKey(char const* key, PARAM_TYPE ptype, void* value, int pos);
    int GetSystemTicketParamForKey(MTICKET_ACCESS const* container, char const* key, PARAM_TYPE ptype,
                                   void* value, int pos);

    // Number of values under the key, 0 without the key. Logged in or not; there must be a container.
    int GetValueCount(MTICKET_ACCESS const* container, int type, int id, wxString key);

    // All values under the key, read one by one with GetParameter; empty when that fails, and when not
    // logged in. A value that cannot be read is the one before it once more.
    wxArrayInt GetIntArray(int type, int id, char* key);
    wxArrayInt GetIntArray(MTICKET_ACCESS const* container, int type, int id, char* key);
    wxArrayInt GetIntArray(MTICKET_ACCESS const* container, int type, int id, wxString key);
    wxArrayString GetStringArray(int type, int id, char* key);
    wxArrayString GetStringArray(MTICKET_ACCESS const* container, int type, int id, char* key);
    wxArrayString GetStringArray(MTICKET_ACCESS const* container, int type, int id, wxString key);

    // --- Whole tickets -----------------------------------------------------------------------------------
    // The slot's result. The first form fetches the implicit session's container anew; neither tests it.
    int DeleteTicketOfType(int type, int id);
    int DeleteTicketOfType(MTICKET_ACCESS const* container, int type, int id);

    // A ticket's data into the caller's buffer. The arguments are between host and plug-in.
    int GetTicketData(int a, int b, int c, int* size, void* data);
    int GetTicketData(TLogin* login, int a, int b, int c, int* size, void* data);

    // --- Ticket files ------------------------------------------------------------------------------------
    // Each call opens the file of that path, does one thing and closes it again. They need no session and no
    // server, but a plug-in. Keys, positions and decoding are those of STICKET_READ and STICKET_MODIFY. A
    // file that cannot be opened gives -1 (int, whatever def is), -1.0, or nothing; a missing key def, -1.0
    // or nothing. Writes give the slot's result, 0 without a file.
    int GetIntParameterFromLocal(wxString path, char const* key, int def, int pos);
    wxString GetStringParameterFromLocal(wxString path, char const* key, int pos);
    double GetDoubleParameterFromLocal(wxString path, char const* key);
    wxStringList GetStringListParameterFromLocal(wxString path, char const* key);    // up to the first gap
    wxArrayString GetStringArrayParameterFromLocal(wxString path, char const* key);  // the same
    wxArrayInt GetIntArrayParameterFromLocal(wxString path, char const* key);        // up to a gap or a -1
    wxArrayDouble GetDoubleArrayFromLocal(wxString path, char const* key);           // -1.0 in a gap
    int SetParameterToLocal(wxString path, char const* key, wxString value);
    int SetParameterToLocal(wxString path, char const* key, wxString value, int pos);
    int SetParameterToLocal(wxString path, char const* key, int value);
    int SetParameterToLocal(wxString path, char const* key, double value);
    int DeleteParameterFromLocal(wxString path, char const* key, int pos);

    // Appends a text to a list unless it is there, letter case included. 0 if it is.
    int AddStringToStringListLocal(wxString path, char const* key, wxString value);

    // --- Notifications -----------------------------------------------------------------------------------
    // Tells the plug-in to call fGUI2NOTIFICATION with pUser, and gets a notification id for it. The
    // plug-in's code, unless told otherwise. The first form faults without a plug-in; the second first
    // switches off what the record's old id heard, gives -1 without a plug-in, and keeps the new id in the
    // record, which the operations below look at. Where the first form keeps its id nobody looks.
    int SetCallback(void* pUser);
    int SetCallback(TLogin* login, void* pUser);

    // Switch notifications of a ticket type, or of one ticket, on and off, under the id of the record; null
    // stands for the implicit session's record. keys: a null-ended table. Always 0, also without a container
    // or with an id of -1, where nothing is done.
    int EnableNotifications(TLogin* login, int type, char const* const* keys);
    int EnableNotifications(TLogin* login, int type, int id, char const* const* keys);
    int DisableNotifications(TLogin* login, int type);

    // What the plug-in calls on a thread of its own: copies the notification and queues it for a
    // ReceiverThread. data: for kind 1 a table of changed parameters, which gives one notification for each
    // run of records that share one key pointer; for other kinds one record, or null.
    static void fGUI2NOTIFICATION(void* pUser, int kind, int argA, int argB, int code, void* data);

    // The queue, first in, first out, without a bound, and its lock. Records are made with new.
    static std::list<NotifData*> m_notificationList;
    static wxCriticalSection m_csNotificationList;

private:
    // What two families do alike, on the state of one of them.
    int InitializeRecord(TLogin* login, int stamp, bool& initialized, unsigned int& portCounter);
    int LoginRecord(TLogin* login, bool& loggedIn);
    int RegisterCallback(void* hSession, STICKET_ACCESS const* ticket, void* pUser, int& notificationId);
    int LogoutRecord(TLogin* login, bool& loggedIn, bool& initialized, unsigned int& portCounter);

    static ComGUIManager* m_pInstance;

    TLogin* m_pLogin = nullptr;          // the implicit session; never null once constructed
    TLogin* m_pBackwardLogin = nullptr;  // set by LoginBackward, nowhere else
    ComGUIModuleInterface** m_pModule = nullptr;
    ComGUIModuleInterface m_interface = {};  // copy of **m_pModule
    void* m_hModuleInstance = nullptr;
    wxCriticalSection m_csManager;  // constructed and destroyed, never locked
    STRINGCACHE m_stringCache;      // constructed and destroyed, never used
    clFOLDER_VARIABLES* m_pFolderVariables = nullptr;
    int m_iGUINotificationID = -1;
    MTICKET_ACCESS const* m_pClientContainer = nullptr;
    wxString m_serverName;
    bool m_bLoggedIn = false;
    bool m_bBackwardLoggedIn = false;
    bool m_bInitialized = false;
    bool m_bBackwardInitialized = false;
    unsigned int m_iLocalPort = 50106;     // next port of Initialize(TLogin*, int)
    unsigned int m_iBackwardPort = 50005;  // next port of InitializeBackward
};
