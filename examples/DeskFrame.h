// What small_desk shows tickets in: controls that know no server. For the window's thread.
#pragma once

#include <comgui/client.h>
#include <functional>
#include <optional>
#include <string>
#include <vector>
#include <wx/button.h>
#include <wx/cmdline.h>
#include <wx/dataview.h>
#include <wx/frame.h>
#include <wx/gauge.h>
#include <wx/timer.h>
#include <wx/treectrl.h>

// The tickets by their types.
class TicketTree : public wxTreeCtrl
{
public:
    explicit TicketTree(wxWindow* parent);

    std::function<void(comgui::TicketAddress)> onChoose;  // by the user, or by ShowTickets

    // tickets: in ascending order. chosen: if it is among them, it is chosen again.
    void ShowTickets(std::vector<comgui::TicketAddress> const& tickets, comgui::TicketAddress chosen);
};

// The keys of a ticket, their types and their values, in which the values can be edited.
class KeyGrid : public wxDataViewListCtrl
{
public:
    explicit KeyGrid(wxWindow* parent);

    // The user has typed that. The old value is shown until Set.
    std::function<void(std::string const& key, std::string const& text)> onEdit;

    void Set(std::string const& key, comgui::Value const& value);  // std::monostate: it goes
    void Clear();

private:
    void EndEdit(wxDataViewEvent& event);

    std::vector<std::string> m_keys;  // of the rows, bytewise
};

struct DESK_OPTIONS
{
    static void AddTo(wxCmdLineParser& parser);

    // Nothing, with a message, if the command line is wrong.
    static std::optional<DESK_OPTIONS> Take(wxCmdLineParser& parser);

    comgui::Server server;
    comgui::Account account{"admin", ""};
    long exitAfter = 0;  // milliseconds; 0: when the user closes the window
    bool isTraced = false;
};

class DeskFrame : public wxFrame
{
public:
    explicit DeskFrame(DESK_OPTIONS const& options);

protected:
    DESK_OPTIONS m_options;

    void Say(std::string const& text);  // in the status bar, and to Trace
    void Trace(std::string const& text) const;

    // Who shall log in, as the user says; nothing if he does not want to. why: the last one could not.
    std::optional<comgui::Account> Ask(std::string const& why, comgui::Account const& last);

    wxButton* const m_send = new wxButton(this, wxID_ANY, "Send a job ...");
    wxButton* const m_cancel = new wxButton(this, wxID_ANY, "Cancel");
    wxGauge* const m_gauge = new wxGauge(this, wxID_ANY, 100);
    TicketTree* const m_tree = new TicketTree(this);
    KeyGrid* const m_grid = new KeyGrid(this);

private:
    void End();

    wxTimer m_end;
};
