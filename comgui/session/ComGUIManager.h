// What a host holds of the library: one object that loads the communication plug-in, logs in and out, and
// hands calls on to the plug-in and to the ticket containers that come from it.
//
// It can hold two sessions at once. Most operations come in families that differ in whose record they use:
//   without a TLogin*     the manager's own record; all that a client with one session needs
//   with a TLogin* first  the caller's record, with the flags and the port counter of the family above
//   ...Backward           another session beside it, with a record, flags and a port counter of its own
// The usual order is IsAlive, Initialize, Login, the work, Logout, Uninitialize; it is not enforced.
//
// Results: 0 is success, and other numbers are the plug-in's, which the library does not look into, except
// for three of its own: -1 (not logged in, or no container), -2005 (no server there, or nothing to write),
// -9999. Whatever ends in a slot of a container, which is reading, writing and deleting, answers the other
// way round: not zero is success.
//
// Threads: no lock anywhere, so one thread at a time; and GetInstance() once before there is a second one.
//
// If the plug-in could not be opened, stderr says so and hSTicketInstance is null. What needs no plug-in
// works then, guarded operations answer -1, and everything else faults, since nothing is tested.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/session/ComGUIModuleInterface.h"
#include "comgui/session/TLogin.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/STRINGCACHE.h"
#include <list>
#include <string>
#include <vector>
#include <wx/arrstr.h>
#include <wx/dynarray.h>
#include <wx/list.h>
#include <wx/string.h>
#include <wx/thread.h>
#include <wx/variant.h>

struct __CFBundle;
struct TCommandRecord;
struct TJobIdentification;
class NotifData;
class SETMULTIPAR_LIST;
class SetDataHolder;
class clFOLDER_VARIABLES;

class COMGUI_EXPORT ComGUIManager
{
public:
    // The process's manager. The first call makes it, and with it the only attempt to open the plug-in; it
    // is there to the end of the process. Never null.
    static ComGUIManager* GetInstance();

    // Opens the plug-in. Hosts go by GetInstance().
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

    // Nothing happens, on purpose: a plug-in that is open stays open.
    void FreeDll();

    // --- Preparing a session -----------------------------------------------------------------------------
    // Gives the record the next local port and lets the plug-in prepare a session for it. Without effect, and
    // 0, while the family is initialised; only the stamp, the host's own mark, is stored even then. Texts are
    // UTF-8, null counts as empty, and what is longer than 127 bytes is cut, wherever a character ends.
    int Initialize(char const* user, char const* password, char const* host, int port);
    int Initialize(TLogin* login, int stamp);
    int InitializeBackward(TLogin* login, int stamp);

    // --- Logging in --------------------------------------------------------------------------------------
    // A failed login, too, leaves its mark: the family counts as logged out from then on.
    //
    // By texts: null, and -1 for the port, stand for what the record holds. Fetches the container as well.
    int Login(char const* user, char const* password, char const* host, int port);

    // The step of the above that talks to the plug-in: login and container, and no flag, so guarded
    // operations do not notice.
    int MacLogin();

    // From here on the record is the manager's, whether the login succeeds or not, and goes with free(): see
    // TLogin.h. The one it replaces is not freed. GetClientContainer() fetches the container.
    int Login(TLogin* login);

    // The record stays the caller's but is kept, whether the login succeeds or not: it must outlive the
    // session's use.
    int LoginBackward(TLogin* login);

    // --- Ending a session --------------------------------------------------------------------------------
    // Before the plug-in is asked, the family counts as neither logged in nor initialised, and its next local
    // port is one less. The container stays where it is.
    int Logout();
    int Logout(TLogin* login);
    int LogoutBackward(TLogin* login);

    // Undo Initialize at the plug-in and then wait for 4 seconds, the Async forms, too. No flag changes here.
    int Uninitialize();
    int Uninitialize(TLogin* login);
    int UninitializeAsync();
    int UninitializeAsync(TLogin* login);

    // --- Testing a server --------------------------------------------------------------------------------
    // Whether a server answers at the record's host and port; no session is needed. 0 and szLocalAddress, or
    // -2005 and an untouched record. IsServerOnline is the same as a yes or no.
    int IsAlive(TLogin* login);
    bool IsServerOnline(TLogin* login);

    // The same for the Backward session, which does not trust the record's port: it reads the port from the
    // system ticket's file, "tickets\\SYS_0000.xml" in the current folder, and keeps it in the record and as
    // the next local port of InitializeBackward. -1 where there is no such file.
    int IsAliveBackward(TLogin* login);

    // Whether the server answers the session that is logged in: 0 or -2005. Both arguments are ignored.
    int IsAlive(char*, int);
    bool IsServerOnline();

    // --- Containers --------------------------------------------------------------------------------------
    // The plug-in's, and null if it has none. What GetClientContainer finds is the one that operations
    // without a container argument use from then on; null changes nothing there. GetBackwardContainer needs a
    // LoginBackward before.
    MTICKET_ACCESS const* GetClientContainer();
    MTICKET_ACCESS const* GetBackwardContainer();
    MTICKET_ACCESS const* GetHandleToClientContainer(TLogin* login);

    // --- Questions: the answers lie in the records, the plug-in is not asked -----------------------------
    wxString GetServerName();          // empty: nothing sets it
    int GetServerName(TLogin* login);  // always -9999, whatever the argument
    wxString GetLocalEndPoint();
    wxString GetCurrentlyLoggedUser();
    wxString GetCurrentlyLoggedUser(TLogin* login);
    int GetCurrentlyLoggedUserTicketID();  // before login: the stamp
    bool IsCurrentUserAdmin();
    bool IsCurrentUserAdmin(TLogin* login);
    wxString GetUserLockInfo();  // "http://<local address>:<local port>"
    wxString GetUserLockInfo(TLogin* login);

    // Whether the server's host is this machine: it is the local address, the host's name or "localhost" in
    // any letter case, or 127.0.0.1. The first form takes the address by the byte, the second in any case.
    bool IsServerLocal();
    bool IsServerLocal(TLogin* login);
    bool IsTernServerLocal();  // a file "ComGUISrv.Dll" lies in the current folder
    int GetEndian();           // always 0x49494949, the bytes "IIII"

    // --- Parameters of tickets ---------------------------------------------------------------------------
    // Of a container, or without that argument of the one from login. type and id: the ticket; key: UTF-8;
    // value: see PARAM_TYPE.h, also for how long a text lives; pos: -1 the key as a whole, 0 and up one of
    // its values. The slot's result, or -1 while the first session is logged out, whoever's the container is.
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

    // By the type that the ticket has: see MTICKET_READ::GetWxVariantParameterChk, and at -1 a list as a
    // whole. -1 while the first session is logged out and for a null container, which leaves the value alone;
    // else 1, and a value that cannot be read is the long -1, as a stored -1 is.
    int GetParameter(MTICKET_ACCESS const* container, int type, int id, char const* key, wxVariant& value,
                     int pos);

    // The same, but with a null marker a value that cannot be read gives 0, and a null variant with the key
    // as its name. Of the marker nothing else counts.
    int GetParameterEx(MTICKET_ACCESS const* container, int type, int id, char const* key, wxVariant& value,
                       int pos, wxVariant marker);

    // Whether the key is there. ptype: its PARAM_TYPE, PARAM_COUNT if it has several values, 0 if there is
    // none, and while the first session is logged out or the container null. elementType: of several values,
    // the type of the one at position 0; else left alone.
    bool GetKeyParameterType(MTICKET_ACCESS const* container, int type, int id, char const* key, int& ptype,
                             int& elementType);

    // Reads with a default, as MTICKET_READ does them, from the container of the login. Logged in or not;
    // there must be a container. The form of GetDoubleParameter with a position takes a whole number for a
    // default.
    int GetIntParameter(int type, int id, char const* key, int def) const;
    int GetIntParameter(int type, int id, int pos, char const* key, int def) const;
    double GetDoubleParameter(int type, int id, char const* key, double def) const;
    double GetDoubleParameter(int type, int id, int pos, char const* key, int def) const;
    bool GetBoolParameter(int type, int id, int pos, char const* key, bool def) const;
    bool GetParameter(int type, int id, char const* key, wxString& value, int pos) const;
    wxString GetwxStringParameter(int type, int id, char const* key, int pos) const;  // empty without a value
    bool GetVectorParameter(int type, int id, char const* key, std::vector<int>& out) const;
    bool GetVectorParameter(int type, int id, char const* key, std::vector<double>& out) const;
    bool GetVectorParameter(int type, int id, char const* key, std::vector<wxString>& out) const;

    // --- Many values at once -----------------------------------------------------------------------------
    // Writes what the holders hold, in one table. Only PARAM_INT, PARAM_DOUBLE and PARAM_STRING are written;
    // a holder of another type than those and PARAM_COUNT goes by the type of the one before it, and that
    // must not make it a double if it has no value. Texts: see SetDataHolder.h, and rather use what follows.
    // The table's slot result; 0 if there was nothing to write, or nothing was; -2005 for an empty vector, -1
    // while the first session is logged out. Unless -1 comes back, all holders are deleted, and the pointers
    // in the vector are dead. null holders are passed over; the second int counts for nothing. The first form
    // fetches the container anew; neither tests it.
    int SetMultiParameter(int type, int id, int, std::vector<SetDataHolder*>& holders);
    int SetMultiParameter(MTICKET_ACCESS const* container, int type, int id, int,
                          std::vector<SetDataHolder*>& holders);

    // Writes what the list holds, in its order. Each record's ok in the list's Table(false) tells what became
    // of it, and nothing else does; they are all 0 when nothing was written: logged out, or no such ticket.
    // The ticket is opened and stays open. The first form fetches the container anew; neither tests it.
    void SetMultiParameter(int type, int id, SETMULTIPAR_LIST& list);
    void SetMultiParameter(MTICKET_ACCESS const* container, int type, int id, SETMULTIPAR_LIST& list);

    // Put the whole list under the key, in place of what was there; an empty one deletes the key. values: of
    // wxVariant*, none null. A "long", "double" or "string", in any letter case, is written as PARAM_INT, cut
    // to 32 bits, PARAM_DOUBLE or PARAM_STRING; any other leaves a gap at its position. Always 0, and no word
    // of a failure.
    int SetMultiParameter(MTICKET_ACCESS const* container, int type, int id, char const* key, wxList& values);
    int SetArrayParameter(MTICKET_ACCESS const* container, int type, int id, char const* key,
                          wxArrayString& values);

    // Deletes a value, or at -1 the key. The slot's result, logged in or not. The first form fetches the
    // container of the manager that GetInstance() gives; neither tests it.
    int DeleteParameter(int type, int id, char const* key, int pos);
    int DeleteParameter(MTICKET_ACCESS const* container, int type, int id, char const* key, int pos);

    // --- Whole tickets -----------------------------------------------------------------------------------
    // Results are the slot's unless told otherwise. They ask for no login, and test no container.
    //
    // The first form fetches the implicit session's container anew.
    int DeleteTicketOfType(int type, int id);
    int DeleteTicketOfType(MTICKET_ACCESS const* container, int type, int id);

    // Whether the ticket is open now. One that is not there is created, of the keys in that null-ended table
    // only; CloseTicket gives either back.
    bool CreateOrOpenTicket(int type, int id, char const* const* keys);
    bool CreateOrOpenTicket(MTICKET_ACCESS const* container, int type, int id, char const* const* keys);
    int CreateNextTicket(MTICKET_ACCESS const* container,
                         int type);  // its id, which the module chooses; or -1
    int CloseTicket(MTICKET_ACCESS const* container, int type, int id);

    // Limits this session's view of the ticket to the keys in that null-ended table.
    int SetPartial(int type, int id, char const* const* keys);
    int SetPartial(MTICKET_ACCESS const* container, int type, int id, char const* const* keys);

    // A ticket's data into a buffer of the caller. What the five values say is between host and plug-in.
    int GetTicketData(int a, int b, int c, int* d, void* data);
    int GetTicketData(TLogin* login, int a, int b, int c, int* d, void* data);

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

    // Appends a text to a list that does not hold it yet, in this letter case. 0 if it does.
    int AddStringToStringListLocal(wxString path, char const* key, wxString value);

    // --- Commands, files and jobs ------------------------------------------------------------------------
    // What the server is asked for beside its tickets. Texts are UTF-8. The plug-in is done with all that it
    // was given when the call returns, and is asked logged in or not; its code comes back.
    //
    // Any command by its name; names are not checked. data: size bytes, a TCommandRecord for a remote
    // command. With "local.set.previewfolder" and "local.set.thumbnailfolder" the first form takes the length
    // of data, a text with its zero byte, for size. A null login is the implicit session.
    int SendCommand(char* command, int size, void* data);
    int SendCommand(TLogin* login, char* command, int size, void* data);

    // Files to the server, and from it. The plug-in knows which of the two paths is the one on this side, and
    // how one on the server is written. The Sync forms wait for the end.
    int PutFile(char*, char*);
    int PutFile(TLogin* login, char*, char*);
    int PutFileSync(char*, char*);
    int GetFile(char*, char*);
    int GetFile(TLogin* login, char*, char*);
    int GetFileSync(char*, char*);

    // Sends the file of that local path as a job of that name.
    int SendJob(TJobIdentification* job, char* path, char* name);
    int SendJob(TLogin* login, TJobIdentification* job, char* path, char* name);

    // Announce a job and send it. path: a file on this side; its leaf name, cut at 251 bytes, is all that is
    // announced. The numbers go to the server as they are, and it says what they mean; only a negative c of
    // PrepareJob does not go. PrepareJob gives the server's answer, which may be negative too, or -1 if the
    // command failed; UploadJob gives 1 if the job was sent and 0 if not, or if there is no memory.
    int PrepareJob(std::string path, int a, int b, int c, int d, int e);
    int UploadJob(std::string path, int a, unsigned int b, int c, int d);

    // A path without $(VARIABLE), with the folders of the server as they were at the first call: a later
    // login changes nothing there. So the container of that call must live as long as the manager is asked.
    // UTF-8; empty while logged out.
    std::string GetDecodedPath(std::string path);

    // What stands behind the last slash or backslash; the whole path if it has neither.
    static std::string LeafName(std::string const& path);

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
    // ReceiverThread. data: with kind 1 what changed, a SETMULTIPAR table, which gives one notification for
    // each run of records that share one key pointer; with other kinds one record, or null.
    static void fGUI2NOTIFICATION(void* pUser, int kind, int argA, int argB, int code, void* data);

    // The queue and its lock. Records go in at the back, as many as come, and out at the front. They come
    // from new and are the queue's until the receiver takes and deletes them.
    static std::list<NotifData*> m_notificationList;
    static wxCriticalSection m_csNotificationList;

private:
    // What two families do alike, on the state of one of them.
    COMGUI_LOCAL int InitializeRecord(TLogin* login, int stamp, bool& initialized, unsigned int& portCounter);
    COMGUI_LOCAL int LoginRecord(TLogin* login, bool& loggedIn);
    COMGUI_LOCAL int RegisterCallback(void* hSession, STICKET_ACCESS const* ticket, void* pUser,
                                      int& notificationId);
    COMGUI_LOCAL int LogoutRecord(TLogin* login, bool& loggedIn, bool& initialized,
                                  unsigned int& portCounter);

    COMGUI_LOCAL int SendRecord(char const* command, TCommandRecord& record);

    COMGUI_LOCAL static ComGUIManager* m_pInstance;

    TLogin* m_pLogin = nullptr;          // the implicit session; never null once constructed
    TLogin* m_pBackwardLogin = nullptr;  // set by LoginBackward, nowhere else
    ComGUIModuleInterface** m_pModule = nullptr;
    ComGUIModuleInterface m_interface = {};  // copy of **m_pModule
    void* m_hModuleInstance = nullptr;
    wxCriticalSection m_csManager;                     // constructed and destroyed, never locked
    STRINGCACHE m_stringCache;                         // constructed and destroyed, never used
    clFOLDER_VARIABLES* m_pFolderVariables = nullptr;  // made on first need, never freed
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
