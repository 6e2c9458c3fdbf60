// The tickets: their types with how many there are, below them those of the chosen type. A search shows what
// it has found in their place.
#pragma once

#include "desk/model/TicketIndex.h"
#include "desk/view/VirtualList.h"
#include <functional>
#include <string>
#include <vector>
#include <wx/panel.h>
#include <wx/srchctrl.h>
#include <wx/stattext.h>

namespace desk
{
class TicketsPane : public wxPanel
{
public:
    // Both outlive the pane. titleOf: what a ticket is called, as far as known; asked for visible rows only.
    TicketsPane(wxWindow* parent, TicketIndex const& index,
                std::function<std::string(comgui::TicketAddress)> titleOf);

    // The user has chosen a ticket; the search's text, empty whenever a search ends, by whatever it does.
    std::function<void(comgui::TicketAddress)> onChoose = [](comgui::TicketAddress) {};
    std::function<void(std::string const&)> onSearch = [](std::string const&) {};

    // The index has other tickets of a type now; one more, or one less, which stands or stood at that place.
    void TicketsChanged(int type);
    void Added(comgui::TicketAddress ticket, std::size_t index);
    void Removed(comgui::TicketAddress ticket, std::size_t index);
    void TitlesChanged();
    void Clear();  // another session

    // A search: begins with nothing found, and goes on until onSearch tells its end. note: how far it is.
    void BeginSearch(wxString const& note);
    void AddFound(std::vector<comgui::TicketAddress> const& found, wxString const& note);

    void Choose(comgui::TicketAddress ticket);
    void FocusSearch() { m_search->SetFocus(); }

private:
    class Types : public RowSource
    {
    public:
        explicit Types(TicketsPane const& pane) : m_pane(pane) {}
        unsigned RowCount() const override;
        wxVariant Cell(unsigned row, unsigned column) const override;

    private:
        TicketsPane const& m_pane;
    };

    class Tickets : public RowSource
    {
    public:
        explicit Tickets(TicketsPane const& pane) : m_pane(pane) {}
        unsigned RowCount() const override;
        wxVariant Cell(unsigned row, unsigned column) const override;

    private:
        TicketsPane const& m_pane;
    };

    comgui::TicketAddress TicketAt(unsigned row) const;
    std::optional<unsigned> RowOf(comgui::TicketAddress ticket) const;
    void EndSearch();
    void Note(wxString const& text);
    void CountChanged(int type);
    void ChooseType(int type);
    void SelectType();
    void ResetTickets();
    void SelectChosen();

    TicketIndex const& m_index;
    std::function<std::string(comgui::TicketAddress)> const m_titleOf;
    std::vector<int> m_shownTypes;
    std::optional<int> m_type;  // whose tickets are shown
    std::optional<std::vector<comgui::TicketAddress>> m_found;
    std::optional<comgui::TicketAddress> m_chosen;
    Types m_typeRows;
    Tickets m_ticketRows;
    wxSearchCtrl* m_search;
    wxStaticText* m_note;
    VirtualList* m_types;
    VirtualList* m_tickets;
};

// "Jobs" for 3, "Type 42" for one that has no name.
wxString NameOfType(int type);
}  // namespace desk
