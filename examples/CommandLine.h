// What the command lines of the examples have in common: which server, who logs in, and numbers.
#pragma once

#include <comgui/client.h>
#include <optional>
#include <string>
#include <wx/cmdline.h>

// Parses the command line, UTF-8: --help goes to standard output, what is wrong to stderr, on a line with the
// program's name. Nothing if the program shall go on, or the status with which to end at once.
std::optional<int> ParseCommandLine(wxCmdLineParser& parser, int argc, char** argv);

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
struct LOGIN
{
    static void AddOptions(wxCmdLineParser& parser);
    bool TakeOptions(wxCmdLineParser const& parser);   // false, and says why, if one cannot be
    bool Enter(comgui::Connection& connection) const;  // likewise, if the login fails

    comgui::Server server;
    comgui::Account account{"admin", "admin"};
};
