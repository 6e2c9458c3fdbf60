#include "CommandLine.h"

#include "Output.h"
#include <charconv>
#include <cstdio>
#include <vector>
#include <wx/init.h>
#include <wx/msgout.h>

namespace
{
// Where wxCmdLineParser tells what is wrong.
class Complaints : public wxMessageOutput
{
public:
    void Output(wxString const& text) override
    {
        wxString line = text.Strip(wxString::both);
        line.Replace("\n", "; ");
        Fail(comgui::ToUtf8(line) + "; " + ProgramName + " --help tells how");
    }
};

// Whatever the locale says; bytes that are no UTF-8 become a mark for them.
void SetCommandLine(wxCmdLineParser& parser, int argc, char** argv)
{
    std::vector<std::wstring> texts(static_cast<std::size_t>(argc));
    std::vector<wchar_t*> words(texts.size());
    for (std::size_t i = 0; i < texts.size(); ++i)
    {
        texts[i] = comgui::ToWx(argv[i]).ToStdWstring();
        words[i] = texts[i].data();
    }
    parser.SetCmdLine(argc, words.data());
}
}  // namespace

std::optional<int> ParseCommandLine(wxCmdLineParser& parser, int argc, char** argv)
{
    static wxInitializer const wx;  // without the arguments, of which it would warn where they are no UTF-8
    if (!wx.IsOk())
    {
        Fail("wxWidgets cannot be started");
        return Trouble;
    }
    SetCommandLine(parser, argc, argv);
    Complaints complaints;
    wxMessageOutput* const before = wxMessageOutput::Set(&complaints);
    int const result = parser.Parse(false);
    wxMessageOutput::Set(before);
    if (result > 0)
        return Trouble;
    if (result == 0)
        return std::nullopt;
    std::fputs(comgui::ToUtf8(parser.GetUsageString()).c_str(), stdout);
    return FlushOutput() ? Good : Trouble;
}

std::optional<int> WholeNumber(std::string const& text, int least, int largest)
{
    int number = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (error != std::errc() || end != text.data() + text.size() || number < least || number > largest)
        return std::nullopt;
    return number;
}

std::string NumberFrom(int least, int largest, std::string const& given)
{
    return "a whole number from " + std::to_string(least) + " to " + std::to_string(largest) + ", not \"" +
           given + "\"";
}

bool TakeNumber(wxCmdLineParser const& parser, char const* option, int& value, int least, int largest)
{
    wxString given;
    if (!parser.Found(option, &given))
        return true;
    std::string const text = comgui::ToUtf8(given);
    auto const number = WholeNumber(text, least, largest);
    value = number.value_or(value);
    return number || Fail(std::string("--") + option + " takes " + NumberFrom(least, largest, text) + "; " +
                          ProgramName + " --help tells how");
}

void LOGIN::AddOptions(wxCmdLineParser& parser)
{
    parser.AddOption("u", "user", "log in as this user (admin)");
    parser.AddOption("p", "password", "with this password (admin)");
    parser.AddOption("s", "server", "at this host (localhost)");
    parser.AddOption("o", "port", "and port (50000)");
}

bool LOGIN::TakeOptions(wxCmdLineParser const& parser)
{
    auto const take = [&parser](char const* option, std::string& text)
    {
        if (wxString given; parser.Found(option, &given))
            text = comgui::ToUtf8(given);
    };
    take("user", account.user);
    take("password", account.password);
    take("server", server.host);
    return TakeNumber(parser, "port", server.port, LeastPort, LargestPort);
}

bool LOGIN::Enter(comgui::Connection& connection) const
{
    auto const user = connection.LogIn(server, account);
    return user || Fail(user.GetError().Text());
}
