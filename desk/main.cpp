// ticket_desk: a window on the tickets of a print server.
#include "desk/model/ServerName.h"
#include "desk/view/MainFrame.h"
#include <comgui/client/Text.h>
#include <iostream>
#include <wx/app.h>
#include <wx/cmdline.h>
#include <wx/config.h>
#include <wx/filename.h>
#include <wx/stdpaths.h>

namespace
{
void AddOptions(wxCmdLineParser& parser)
{
    parser.AddSwitch("h", "help", "show this text", wxCMD_LINE_OPTION_HELP);
    parser.AddOption("", "server", "log in there at once, HOST or HOST:PORT");
    parser.AddOption("", "user", "who logs in (admin)");
    parser.AddOption("", "password", "with it; without one the desk asks");
    parser.AddOption("", "ticket", "show it at once, as TYPE/ID: 3/1 is job 1");
    parser.AddOption("", "language", "of the window, as de, fr or ja; else that of the system");
}

}  // namespace

class TicketDesk : public wxApp
{
public:
    bool OnInit() override
    {
        SetAppName("ticket_desk");
        wxCmdLineParser parser(argc, argv);
        AddOptions(parser);
        if (parser.Parse() != 0)
            return false;
        wxString language;
        parser.Found("language", &language);
        Translate(language);
        SetAppDisplayName(_("Ticket desk"));
        auto* const frame = new desk::MainFrame;
        wxString ticket;
        if (parser.Found("ticket", &ticket))
            frame->ShowFirst(comgui::ToUtf8(ticket));
        frame->Show();
        frame->CallAfter([frame, server = ServerOf(parser), account = AccountOf(parser)]
                         { Begin(*frame, server, account); });
        return true;
    }

private:
    static wxString ServerOf(wxCmdLineParser const& parser)
    {
        wxString server;
        parser.Found("server", &server);
        return server;
    }

    static comgui::Account AccountOf(wxCmdLineParser const& parser)
    {
        wxString user = "admin";
        wxString password;
        parser.Found("user", &user);
        parser.Found("password", &password);
        return {comgui::ToUtf8(user), comgui::ToUtf8(password)};
    }

    static void Begin(desk::MainFrame& frame, wxString const& name, comgui::Account const& account)
    {
        auto const server = desk::ServerFromText(name.empty() ? "localhost" : comgui::ToUtf8(name));
        if (!server)
            frame.AskForLogin(comgui::ToUtf8(wxString::Format(_("%s: no server"), name)));
        else if (account.password.empty())
            frame.AskForLogin();
        else
            frame.LogIn(*server, account);
    }

    // Catalogues lie where the program was installed, or built.
    static void Translate(wxString const& language)
    {
        wxFileName programs(wxStandardPaths::Get().GetExecutablePath());
        programs.RemoveLastDir();
        wxFileTranslationsLoader::AddCatalogLookupPathPrefix(programs.GetPath() + "/share/locale");
        auto* const translations = new wxTranslations;
        if (!language.empty())
            translations->SetLanguage(language);
        wxTranslations::Set(translations);
        for (char const* const domain : {"ticket_desk", "comgui", "wxstd"})
            translations->AddCatalog(domain);
    }
};

wxIMPLEMENT_APP_NO_MAIN(TicketDesk);

int main(int argc, char** argv)
{
    if (argc != 2 || std::string(argv[1]) != "--help")
        return wxEntry(argc, argv);
    wxCmdLineParser parser(argc, argv);  // needs no display
    AddOptions(parser);
    std::cout << comgui::ToUtf8(parser.GetUsageString());
    return 0;
}
