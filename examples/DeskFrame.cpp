#include "DeskFrame.h"

#include "Shown.h"

#include <algorithm>
#include <iostream>
#include <wx/creddlg.h>
#include <wx/sizer.h>

namespace
{
struct TicketItem : wxTreeItemData
{
    explicit TicketItem(comgui::TicketAddress address) : ticket(address) {}
    comgui::TicketAddress const ticket;
};
}  // namespace

TicketTree::TicketTree(wxWindow* parent)
    : wxTreeCtrl(parent, wxID_ANY, {}, {}, wxTR_DEFAULT_STYLE | wxTR_HIDE_ROOT)
{
    Bind(wxEVT_TREE_SEL_CHANGED,
         [this](wxTreeEvent& event)
         {
             if (event.GetItem().IsOk())
                 if (auto const* const item = static_cast<TicketItem*>(GetItemData(event.GetItem())))
                     onChoose(item->ticket);
         });
}

void TicketTree::ShowTickets(std::vector<comgui::TicketAddress> const& tickets, comgui::TicketAddress chosen)
{
    DeleteAllItems();
    wxTreeItemId const root = AddRoot("");
    wxTreeItemId type;
    for (std::size_t i = 0; i < tickets.size(); ++i)
    {
        comgui::TicketAddress const ticket = tickets[i];
        if (i == 0 || ticket.type != tickets[i - 1].type)
            type = AppendItem(root, wxString::Format("Type %d", ticket.type));
        auto const name = wxString::Format("%d/%d", ticket.type, ticket.id);
        wxTreeItemId const item = AppendItem(type, name, -1, -1, new TicketItem(ticket));
        if (ticket == chosen)
            SelectItem(item);
    }
}

KeyGrid::KeyGrid(wxWindow* parent) : wxDataViewListCtrl(parent, wxID_ANY)
{
    AppendTextColumn("Key", wxDATAVIEW_CELL_INERT, 300);
    AppendTextColumn("Type", wxDATAVIEW_CELL_INERT, 80);
    AppendTextColumn("Value", wxDATAVIEW_CELL_EDITABLE);
    Bind(wxEVT_DATAVIEW_ITEM_EDITING_DONE, &KeyGrid::EndEdit, this);
}

void KeyGrid::Clear()
{
    DeleteAllItems();
    m_keys.clear();
}

void KeyGrid::Set(std::string const& key, comgui::Value const& value)
{
    auto const place = std::lower_bound(m_keys.begin(), m_keys.end(), key);
    auto const row = static_cast<unsigned int>(place - m_keys.begin());
    bool const isThere = place != m_keys.end() && *place == key;
    if (isThere && value.IsNone())
    {
        DeleteItem(row);
        m_keys.erase(place);
    }
    if (value.IsNone())
        return;
    wxVector<wxVariant> cells;
    for (std::string const& text : {key, std::string(comgui::NameOf(value.Type())), comgui::ToText(value)})
        cells.push_back(comgui::ToWx(text));
    if (!isThere)
    {
        InsertItem(row, cells);
        m_keys.insert(place, key);
    }
    for (unsigned int column = 1; isThere && column < cells.size(); ++column)
        if (GetTextValue(row, column) != cells[column].GetString())
            SetTextValue(cells[column].GetString(), row, column);
}

void KeyGrid::EndEdit(wxDataViewEvent& event)
{
    int const row = ItemToRow(event.GetItem());
    if (event.IsEditCancelled() || row == wxNOT_FOUND)
        return;
    event.Veto();
    // What is shown need not be all that is there: bytes that are no text are shown as a mark for them.
    wxString const text = event.GetValue().GetString();
    if (text != GetTextValue(static_cast<unsigned int>(row), 2))
        onEdit(m_keys[static_cast<std::size_t>(row)], comgui::ToUtf8(text));
}

void DESK_OPTIONS::AddTo(wxCmdLineParser& parser)
{
    parser.AddSwitch("h", "help", "show this text", wxCMD_LINE_OPTION_HELP);
    parser.AddOption("", "server", "where it is, HOST or HOST:PORT (localhost:50000)");
    parser.AddOption("", "user", "who logs in (admin)");
    parser.AddOption("", "password", "log in with it at once, without a question");
    parser.AddOption("", "exit-after", "close after so many milliseconds", wxCMD_LINE_VAL_NUMBER);
    parser.AddSwitch("", "trace", "print messages and changes, too");
}

std::optional<DESK_OPTIONS> DESK_OPTIONS::Take(wxCmdLineParser& parser)
{
    wxString server = "localhost:50000";
    wxString user = "admin";
    wxString password;
    DESK_OPTIONS options;
    if (parser.Parse() != 0)
        return std::nullopt;
    parser.Found("server", &server);
    parser.Found("user", &user);
    parser.Found("password", &password);
    parser.Found("exit-after", &options.exitAfter);
    options.isTraced = parser.Found("trace");
    options.account = {comgui::ToUtf8(user), comgui::ToUtf8(password)};
    options.server.host = comgui::ToUtf8(server.BeforeFirst(':'));
    long port = options.server.port;
    if (server.Contains(":") && (!server.AfterFirst(':').ToLong(&port) || port < 1 || port > 65535))
        port = 0;  // which the kit refuses
    options.server.port = static_cast<int>(port);
    return options;
}

DeskFrame::DeskFrame(DESK_OPTIONS const& options)
    : wxFrame(nullptr, wxID_ANY, "Small desk", {}, {900, 600}), m_options(options)
{
    auto* const top = new wxBoxSizer(wxHORIZONTAL);
    for (wxWindow* const each : std::initializer_list<wxWindow*>{m_send, m_cancel, m_gauge})
        top->Add(each, wxSizerFlags().Border());
    auto* const below = new wxBoxSizer(wxHORIZONTAL);
    below->Add(m_tree, wxSizerFlags(1).Expand());
    below->Add(m_grid, wxSizerFlags(4).Expand());
    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(top);
    all->Add(below, wxSizerFlags(1).Expand());
    SetSizer(all);
    CreateStatusBar();
    m_cancel->Disable();
    m_end.Bind(wxEVT_TIMER, [this](auto&) { End(); });
    if (options.exitAfter > 0)
        m_end.StartOnce(static_cast<int>(options.exitAfter));
}

// A dialog that is open keeps the program alive.
void DeskFrame::End()
{
    for (wxWindow* const each : GetChildren())
        if (auto* const dialog = dynamic_cast<wxDialog*>(each); dialog && dialog->IsModal())
            return dialog->EndModal(wxID_CANCEL);
    Close();
}

void DeskFrame::Say(std::string const& text)
{
    SetStatusText(comgui::ToWx(text));
    Trace(text);
}

void DeskFrame::Trace(std::string const& text) const
{
    if (m_options.isTraced)
        std::cout << Shown(text) << std::endl;
}

std::optional<comgui::Account> DeskFrame::Ask(std::string const& why, comgui::Account const& last)
{
    wxCredentialEntryDialog dialog(this, comgui::ToWx(why), "Log in",
                                   {comgui::ToWx(last.user), wxSecretValue()});
    if (dialog.ShowModal() != wxID_OK)
        return std::nullopt;
    wxWebCredentials const given = dialog.GetCredentials();
    return comgui::Account{comgui::ToUtf8(given.GetUser()),
                           comgui::ToUtf8(given.GetPassword().GetAsString())};
}
