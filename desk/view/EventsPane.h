// Live events, the latest at the bottom, with a filter and a pause.
#pragma once

#include "desk/model/EventLog.h"
#include "desk/view/VirtualList.h"
#include <comgui/client.h>
#include <functional>
#include <wx/checkbox.h>
#include <wx/panel.h>
#include <wx/srchctrl.h>
#include <wx/tglbtn.h>

namespace desk
{
class EventsPane : public wxPanel, private RowSource
{
public:
    explicit EventsPane(wxWindow* parent);

    std::function<void(comgui::TicketAddress, std::string const& key)> onChoose = [](auto, auto const&) {};

    // Cheap; the list shows it with the next Repaint.
    void Take(comgui::Event const& event) { m_log.Append(event, std::chrono::system_clock::now()); }
    void Repaint();

    void ShowOnly(std::optional<comgui::TicketAddress> ticket);  // where the box for it is ticked
    void TogglePause();
    void Clear();

private:
    enum COLUMN : unsigned
    {
        TimeColumn,
        KindColumn,
        TicketColumn,
        KeyColumn,
        TextColumn,
    };

    unsigned RowCount() const override { return static_cast<unsigned>(m_shown); }
    wxVariant Cell(unsigned row, unsigned column) const override;
    bool Look(unsigned row, unsigned column, wxDataViewItemAttr& look) const override;

    void Filter();
    void Reset();
    void Choose();

    EventLog m_log;
    std::size_t m_shown = 0;              // rows that the list knows
    std::optional<std::size_t> m_chosen;  // its number in the log
    std::optional<comgui::TicketAddress> m_ticket;
    wxSearchCtrl* m_filter;
    wxCheckBox* m_onlyTicket;
    wxToggleButton* m_pause;
    VirtualList* m_list;
};

// "changed", "deleted" ...
wxString NameOf(EventKind kind);
}  // namespace desk
