// What the examples with a command line have in common: which server, who logs in, and how a program hears
// of changes.
#pragma once

#include <comgui/comgui.h>
#include <csignal>
#include <functional>
#include <future>
#include <optional>
#include <string>
#include <wx/cmdline.h>

extern char const ProgramName[];  // each program's own, for its messages

// How the examples end.
enum STATUS
{
    Good = 0,
    Refused = 1,  // the answer is no: what was asked for is not there, or was refused
    Trouble = 2,  // wrong command line, no server, no login, output that cannot be written
};

// Parses the command line: --help goes to standard output, what is wrong to stderr, on a line with the
// program's name. Nothing if the program shall go on, or the status with which to end at once.
std::optional<int> ParseCommandLine(wxCmdLineParser& parser);

// The number that a text is: digits, with a sign only if it is negative. Nothing if it is none, or not in the
// range.
std::optional<int> WholeNumber(std::string const& text, int least, int largest);

// What a number that was asked for must be, as the end of a sentence.
std::string NumberFrom(int least, int largest, std::string const& given);

// Takes the number of an option without a type, which keeps its value unless it was given. False, and says
// why, if it is not in the range.
bool TakeNumber(wxCmdLineParser const& parser, char const* option, int& value, int least, int largest);

constexpr int LeastPort = 1;
constexpr int LargestPort = 65535;

// Where the server is, and as whom to log in.
struct SERVER
{
    static void AddOptions(wxCmdLineParser& parser);
    bool TakeOptions(wxCmdLineParser const& parser);  // false, and says why, if one cannot be

    wxString user = "admin";
    wxString password = "admin";
    wxString host = "localhost";
    int port = 50000;
};

// Says on stderr what went wrong, on one line and harmless on a terminal, with the plug-in's code where it
// was the plug-in; always false.
bool Fail(std::string const& what);
bool Fail(std::string const& what, int code);

// Sends what was printed on its way. False if it cannot be written; says so the first time, unless it goes to
// a pipe that was closed: whoever closed it knows. Needs SIGPIPE ignored.
bool FlushOutput();

// Whether the library found its plug-in; says so if not.
bool IsPlugInThere();

// A record of the host's own for one session. From calloc, since one that is logged in becomes the manager's.
TLogin* NewRecord(char const* user, char const* password, SERVER const& server);

// Looks for the server, prepares a session and logs in; says why if it cannot. Takes the record over: it is
// the manager's once it comes to the login, and is freed if it does not.
bool LogIn(ComGUIManager& manager, TLogin* login);

// A host's own mark of its sessions; the plug-in only carries it.
constexpr int Stamp = 20260101;

// Waits for Ctrl-C and its like. Made before any thread, it blocks them in all of them, so that none is lost.
class EndSignals
{
public:
    EndSignals();
    void Wait() const;         // until one comes, or has come; the next one ends the program at once
    static bool ArePending();  // has one come that nobody has waited for?
    static void Raise();       // as if somebody had ended the program from outside

private:
    sigset_t m_signals;
};

// Hears events as long as it lives. The handler runs on the receiver's thread, and should be quick, since the
// plug-in waits meanwhile.
class EventReceiver
{
public:
    explicit EventReceiver(std::function<void(ServerNotificationEvent const&)> handler);
    ~EventReceiver();
    EventReceiver(EventReceiver const&) = delete;
    EventReceiver& operator=(EventReceiver const&) = delete;

private:
    unsigned long long m_subscription;
    std::promise<void> m_ended;
    ReceiverThread* m_thread;
};
