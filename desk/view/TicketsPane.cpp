#include "desk/view/TicketsPane.h"

#include "desk/model/DisplayText.h"
#include <comgui/client/Text.h>
#include <wx/intl.h>
#include <wx/sizer.h>

namespace desk
{
namespace
{
constexpr std::size_t TitleLength = 120;
}

wxString NameOfType(int type)
{
    switch (type)
    {
    case comgui::SystemTickets:
        return _("System");
    case comgui::DeviceTickets:
        return _("Devices");
    case comgui::JobTickets:
        return _("Jobs");
    case comgui::QueueTickets:
        return _("Queues");
    case comgui::PaperTickets:
        return _("Papers");
    case comgui::UserTickets:
        return _("Users");
    default:
        return wxString::Format(_("Type %d"), type);
    }
}

unsigned TicketsPane::Types::RowCount() const { return static_cast<unsigned>(m_pane.m_shownTypes.size()); }

wxVariant TicketsPane::Types::Cell(unsigned row, unsigned column) const
{
    int const type = m_pane.m_shownTypes[row];
    if (column == 0)
        return NameOfType(type);
    return wxString::Format("%zu", m_pane.m_index.Count(type));
}

unsigned TicketsPane::Tickets::RowCount() const
{
    if (m_pane.m_found)
        return static_cast<unsigned>(m_pane.m_found->size());
    return m_pane.m_type ? static_cast<unsigned>(m_pane.m_index.Count(*m_pane.m_type)) : 0;
}

wxVariant TicketsPane::Tickets::Cell(unsigned row, unsigned column) const
{
    comgui::TicketAddress const ticket = m_pane.TicketAt(row);
    if (column == 0)
        return wxString::Format("%d/%d", ticket.type, ticket.id);
    return comgui::ToWx(DisplayText(m_pane.m_titleOf(ticket), TitleLength));
}

TicketsPane::TicketsPane(wxWindow* parent, TicketIndex const& index,
                         std::function<std::string(comgui::TicketAddress)> titleOf)
    : wxPanel(parent), m_index(index), m_titleOf(std::move(titleOf)), m_typeRows(*this), m_ticketRows(*this)
{
    m_search = new wxSearchCtrl(this, wxID_ANY);
    m_search->SetName("search");
    m_search->SetDescriptiveText(_("Key, text or key=value"));
    m_search->ShowCancelButton(true);
    m_note = new wxStaticText(this, wxID_ANY, {});
    m_note->SetName("search note");
    m_types = new VirtualList(this, "types", m_typeRows);
    m_types->AddTextColumn(_("Type"), 130);
    m_types->AddTextColumn(_("Tickets"), 70, wxALIGN_RIGHT);
    m_tickets = new VirtualList(this, "tickets", m_ticketRows);
    m_tickets->AddTextColumn(_("Ticket"), 90);
    m_tickets->AddTextColumn(_("Name"), 160);

    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(m_search, wxSizerFlags().Expand().Border());
    all->Add(m_note, wxSizerFlags().Expand().Border(wxLEFT | wxRIGHT));
    all->Add(m_types, wxSizerFlags(2).Expand());
    all->Add(m_tickets, wxSizerFlags(5).Expand());
    SetSizer(all);

    m_types->Bind(wxEVT_DATAVIEW_SELECTION_CHANGED,
                  [this](auto&)
                  {
                      if (auto const row = m_types->Selected())
                          ChooseType(m_shownTypes[*row]);
                  });
    m_tickets->Bind(wxEVT_DATAVIEW_SELECTION_CHANGED,
                    [this](auto&)
                    {
                        if (auto const row = m_tickets->Selected())
                        {
                            m_chosen = TicketAt(*row);
                            onChoose(*m_chosen);
                        }
                    });
    m_search->Bind(wxEVT_SEARCH,
                   [this](auto&)
                   {
                       std::string const text = comgui::ToUtf8(m_search->GetValue());
                       text.empty() ? EndSearch() : onSearch(text);
                   });
    m_search->Bind(wxEVT_SEARCH_CANCEL,
                   [this](auto&)
                   {
                       m_search->Clear();
                       EndSearch();
                   });
}

void TicketsPane::TicketsChanged(int type)
{
    CountChanged(type);
    if (m_type == type && !m_found)
        ResetTickets();
}

void TicketsPane::Added(comgui::TicketAddress ticket, std::size_t index)
{
    CountChanged(ticket.type);
    if (m_type == ticket.type && !m_found)
        m_tickets->RowInserted(static_cast<unsigned>(index));
}

void TicketsPane::Removed(comgui::TicketAddress ticket, std::size_t index)
{
    CountChanged(ticket.type);
    if (m_type == ticket.type && !m_found)
        m_tickets->RowDeleted(static_cast<unsigned>(index));
}

void TicketsPane::CountChanged(int type)
{
    std::vector<int> types = m_index.Types();
    if (types == m_shownTypes)
    {
        m_types->RowChanged(
            static_cast<unsigned>(std::find(types.begin(), types.end(), type) - types.begin()));
        return;
    }
    m_shownTypes = std::move(types);
    m_types->Reset();
    if (m_type)
        SelectType();
    else if (m_index.Count(type) > 0)
        ChooseType(type);
}

void TicketsPane::Clear()
{
    m_chosen.reset();
    m_type.reset();
    m_shownTypes.clear();
    m_types->Reset();
    EndSearch();
}

void TicketsPane::TitlesChanged() { m_tickets->RowsLookDifferent(); }

void TicketsPane::BeginSearch(wxString const& note)
{
    m_found.emplace();
    Note(note);
    ResetTickets();
}

void TicketsPane::AddFound(std::vector<comgui::TicketAddress> const& found, wxString const& note)
{
    if (!m_found)
        return;
    std::size_t const first = m_found->size();
    m_found->insert(m_found->end(), found.begin(), found.end());
    Note(note);
    m_tickets->RowsReplaced(first, 0, found.size());
    SelectChosen();
}

void TicketsPane::EndSearch()
{
    m_found.reset();
    Note({});
    ResetTickets();
    onSearch({});
}

void TicketsPane::Note(wxString const& text)
{
    m_note->SetLabelText(text);
    Layout();  // it may have more lines now
}

void TicketsPane::Choose(comgui::TicketAddress ticket)
{
    if (!RowOf(ticket))
        EndSearch();
    if (m_type != ticket.type && !m_found)
        ChooseType(ticket.type);
    m_chosen = ticket;
    if (auto const row = RowOf(ticket))
        m_tickets->SelectRow(*row);
    onChoose(ticket);
}

void TicketsPane::ChooseType(int type)
{
    if (m_type == type && !m_found)
        return;
    m_type = type;
    EndSearch();
    SelectType();
}

void TicketsPane::SelectType()
{
    auto const place = std::find(m_shownTypes.begin(), m_shownTypes.end(), *m_type);
    auto const row = static_cast<unsigned>(place - m_shownTypes.begin());
    if (place != m_shownTypes.end() && m_types->Selected() != row)
        m_types->SelectRow(row);
}

// The chosen ticket stays chosen, wherever it is now.
void TicketsPane::ResetTickets()
{
    m_tickets->UnselectAll();
    m_tickets->Reset();
    SelectChosen();
}

void TicketsPane::SelectChosen()
{
    auto const row = m_chosen ? RowOf(*m_chosen) : std::nullopt;
    if (row && m_tickets->Selected() != row)
        m_tickets->SelectRow(*row);
}

comgui::TicketAddress TicketsPane::TicketAt(unsigned row) const
{
    return m_found ? (*m_found)[row] : m_index.At(*m_type, row).value_or(comgui::TicketAddress());
}

std::optional<unsigned> TicketsPane::RowOf(comgui::TicketAddress ticket) const
{
    if (m_found)
    {
        auto const found = std::find(m_found->begin(), m_found->end(), ticket);
        return found == m_found->end() ? std::nullopt
                                       : std::optional(static_cast<unsigned>(found - m_found->begin()));
    }
    if (m_type != ticket.type)
        return std::nullopt;
    auto const index = m_index.IndexOf(ticket);
    return index ? std::optional(static_cast<unsigned>(*index)) : std::nullopt;
}
}  // namespace desk
