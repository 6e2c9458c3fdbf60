// A host with a window, as its author would write it. With --help it opens none, and needs no display.
#include <comgui/comgui.h>
#include <cstring>
#include <iostream>
#include <wx/app.h>
#include <wx/frame.h>

static_assert(wxUSE_GUI == 1, "the package must leave wxWidgets' GUI to those who have windows");

class Window : public wxFrame
{
public:
    Window() : wxFrame(nullptr, wxID_ANY, "Tickets")
    {
        Bind(EVT_SERVER_NOTIFICATION,
             [this](ServerNotificationEvent& event) { SetTitle(event.GetNotifData().NotifKey); });
    }
};

class Program : public wxApp
{
public:
    bool OnInit() override { return (new Window)->Show(); }
};

wxIMPLEMENT_APP_NO_MAIN(Program);

int main(int argc, char** argv)
{
    if (argc < 2 || std::strcmp(argv[1], "--help") != 0)
        return wxEntry(argc, argv);
    ComGUIManager::GetInstance();
    std::cout << (hSTicketInstance ? "Has the plug-in\n" : "Has no plug-in\n");
    return 0;
}
