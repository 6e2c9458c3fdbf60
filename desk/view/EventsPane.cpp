#include "desk/view/EventsPane.h"

#include "desk/model/DisplayText.h"
#include "desk/model/TextMatch.h"
#include "desk/view/NumberText.h"
#include "desk/view/Theme.h"
#include <algorithm>
#include <comgui/client/Text.h>
#include <wx/datetime.h>
#include <wx/intl.h>
#include <wx/sizer.h>

namespace desk
{
namespace
{
wxString TextOf(std::chrono::system_clock::time_point time)
{
    auto const sinceEpoch = std::chrono::duration_cast<std::chrono::milliseconds>(time.time_since_epoch());
    return wxDateTime(wxLongLong(sinceEpoch.count())).Format("%H:%M:%S.%l");
}

wxString TicketOf(EventRow const& row)
{
    if (row.transfer)
        return wxString::Format("#%d", *row.transfer);
    if (!row.type)
        return {};
    return row.id ? wxString::Format("%d/%d", *row.type, *row.id) : wxString::Format("%d/*", *row.type);
}

unsigned FormOf(long long count) { return PluralOf(static_cast<std::uint64_t>(std::max(count, 0LL))); }

wxString TextOf(EventRow const& row)
{
    if (row.kind == EventKind::MoreKeys)
        return wxString::Format(wxPLURAL("and %lld more key", "and %lld more keys", FormOf(row.count)),
                                row.count);
    if (row.kind == EventKind::TransferProgressed)
        return row.total
                   ? wxString::Format(wxPLURAL("%lld of %lld byte", "%lld of %lld bytes", FormOf(*row.total)),
                                      row.count, *row.total)
                   : wxString::Format(wxPLURAL("%lld byte", "%lld bytes", FormOf(row.count)), row.count);
    if (row.kind == EventKind::TransferEnded && row.job)
        return wxString::Format(_("job %d"), *row.job);
    return comgui::ToWx(row.text);
}
}  // namespace

wxString NameOf(EventKind kind)
{
    switch (kind)
    {
    case EventKind::KeyChanged:
    case EventKind::KeyToRead:
    case EventKind::MoreKeys:
    case EventKind::TicketChanged:
        return _("changed");
    case EventKind::KeyDeleted:
        return _("key deleted");
    case EventKind::TicketCreated:
        return _("created");
    case EventKind::TicketDeleted:
        return _("deleted");
    case EventKind::ManyTicketsChanged:
        return _("many changed");
    case EventKind::TransferProgressed:
        return _("on its way");
    case EventKind::TransferEnded:
        return _("arrived");
    case EventKind::TransferFailed:
        return _("failed");
    case EventKind::ServerLost:
        return _("server lost");
    case EventKind::ServerBack:
    case EventKind::ServerBackAnew:
        return _("server back");
    }
    return {};
}

EventsPane::EventsPane(wxWindow* parent) : wxPanel(parent)
{
    m_filter = new wxSearchCtrl(this, wxID_ANY);
    m_filter->SetName("filter of events");
    m_filter->SetDescriptiveText(_("Filter events"));
    m_filter->ShowCancelButton(true);
    m_onlyTicket = new wxCheckBox(this, wxID_ANY, _("&Only the chosen ticket"));
    m_onlyTicket->SetName("only the chosen ticket");
    m_pause = new wxToggleButton(this, wxID_ANY, _("&Pause"));
    m_pause->SetName("pause");
    m_list = new VirtualList(this, "events", *this);
    m_list->AddTextColumn(_("Time"), 110);
    m_list->AddTextColumn(_("Event"), 110);
    m_list->AddTextColumn(_("Ticket"), 80);
    m_list->AddTextColumn(_("Key"), 260);
    m_list->AddTextColumn(_("Value"), 360);

    auto* const top = new wxBoxSizer(wxHORIZONTAL);
    top->Add(m_filter, wxSizerFlags(1).Border());
    top->Add(m_onlyTicket, wxSizerFlags().CenterVertical().Border());
    top->Add(m_pause, wxSizerFlags().Border());
    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(top, wxSizerFlags().Expand());
    all->Add(m_list, wxSizerFlags(1).Expand());
    SetSizer(all);

    m_filter->Bind(wxEVT_TEXT, [this](auto&) { Filter(); });
    m_filter->Bind(wxEVT_SEARCH_CANCEL, [this](auto&) { m_filter->Clear(); });
    m_onlyTicket->Bind(wxEVT_CHECKBOX, [this](auto&) { Filter(); });
    m_pause->Bind(wxEVT_TOGGLEBUTTON,
                  [this](wxCommandEvent& event)
                  {
                      event.IsChecked() ? m_log.Pause() : m_log.Resume();
                      Repaint();
                  });
    m_list->Bind(wxEVT_DATAVIEW_SELECTION_CHANGED,
                 [this](auto&)
                 {
                     auto const row = m_list->Selected();
                     m_chosen =
                         row && *row < m_log.RowCount() ? std::optional(m_log.NumberOf(*row)) : std::nullopt;
                 });
    m_list->Bind(wxEVT_DATAVIEW_ITEM_ACTIVATED, [this](auto&) { Choose(); });
}

// Follows the end, unless the user has chosen a row to look at.
void EventsPane::Repaint()
{
    m_pause->SetLabel(m_log.IsPaused() && m_log.CameMeanwhile() > 0
                          ? wxString::Format(_("&Pause (%zu)"), m_log.CameMeanwhile())
                          : _("&Pause"));
    EventLog::Changes const changes = m_log.TakeChanges();
    if (!changes.isReset && changes.gone == 0 && changes.came == 0)
        return;
    std::size_t const before = m_shown;
    m_shown = m_log.RowCount();
    if (changes.isReset || changes.gone > 0)
        Reset();
    else
        m_list->RowsReplaced(before, 0, changes.came);
    if (m_shown > 0 && !m_list->Selected())
        m_list->ShowRow(static_cast<unsigned>(m_shown - 1));
}

// Rows move, what is chosen stays so.
void EventsPane::Reset()
{
    m_list->Reset();
    auto const row = m_chosen ? m_log.IndexOf(*m_chosen) : std::nullopt;
    if (row)
        m_list->SelectRow(static_cast<unsigned>(*row));
    else
        m_chosen.reset();
}

void EventsPane::ShowOnly(std::optional<comgui::TicketAddress> ticket)
{
    m_ticket = ticket;
    if (m_onlyTicket->IsChecked())
        Filter();
}

void EventsPane::TogglePause()
{
    m_pause->SetValue(!m_pause->GetValue());
    m_pause->GetValue() ? m_log.Pause() : m_log.Resume();
    Repaint();
}

void EventsPane::Clear()
{
    m_log.Clear();
    Repaint();
}

void EventsPane::Filter()
{
    EventFilter filter;
    if (TextMatch const match(comgui::ToUtf8(m_filter->GetValue())); !match.IsEmpty())
        filter.isWanted = [match](std::string_view text) { return match.IsIn(text); };
    if (m_onlyTicket->IsChecked())
        filter.ticket = m_ticket;
    m_log.SetFilter(std::move(filter));
    Repaint();
}

void EventsPane::Choose()
{
    auto const row = m_list->Selected();
    if (!row || *row >= m_log.RowCount())
        return;
    EventRow const& event = m_log.RowAt(*row);
    if (event.type && event.id)
        onChoose({*event.type, *event.id}, event.key);
}

wxVariant EventsPane::Cell(unsigned row, unsigned column) const
{
    if (row >= m_log.RowCount())
        return wxString();
    EventRow const& event = m_log.RowAt(row);
    switch (column)
    {
    case TimeColumn:
        return TextOf(event.time);
    case KindColumn:
        return NameOf(event.kind);
    case TicketColumn:
        return TicketOf(event);
    case KeyColumn:
        return comgui::ToWx(DisplayText(event.key));
    default:
        return TextOf(event);
    }
}

bool EventsPane::Look(unsigned row, unsigned column, wxDataViewItemAttr& look) const
{
    if (column != KindColumn || row >= m_log.RowCount())
        return false;
    EventKind const kind = m_log.RowAt(row).kind;
    bool const isBad = kind == EventKind::ServerLost || kind == EventKind::TransferFailed;
    bool const isGood = kind == EventKind::ServerBack || kind == EventKind::ServerBackAnew;
    if (isBad || isGood)
        look.SetColour(ColourOf(isBad ? Accent::Bad : Accent::Good));
    return isBad || isGood;
}
}  // namespace desk
