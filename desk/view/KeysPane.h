// The keys of one ticket as a tree by their slashes, with their types and values, which are edited in place.
#pragma once

#include "desk/model/KeyOutline.h"
#include "desk/model/TicketContent.h"
#include "desk/view/VirtualList.h"
#include <comgui/client.h>
#include <functional>
#include <optional>
#include <string>
#include <wx/panel.h>
#include <wx/srchctrl.h>
#include <wx/stattext.h>
#include <wx/timer.h>

namespace desk
{
class KeysPane : public wxPanel, private RowSource
{
public:
    explicit KeysPane(wxWindow* parent);

    // The user has typed that as the value of the key. What is shown stays until Take. changed: what somebody
    // else has written there since the edit began; null: nothing.
    std::function<void(std::string const& key, std::string const& text, comgui::Value const* changed)>
        onEdit = [](auto&, auto&, auto*) {};

    // Another ticket, of which nothing is known yet. heading: above its keys.
    void ShowTicket(wxString const& heading);

    // What it holds now, and what of that is news. While the user edits a value, rows neither come nor go.
    void Take(comgui::Snapshot const& ticket, std::vector<comgui::SnapshotDifference> const& differences);

    // Says at the cell why its value was refused.
    void Explain(std::string const& key, wxString const& why);

    std::optional<std::string> ChosenKey() const;
    comgui::Value const* ValueOf(std::string const& key) const;
    void Choose(std::string const& key);
    void EditChosen();
    void OpenAll();
    void CloseAll();
    void FocusFilter() { m_filter->SetFocus(); }

private:
    enum COLUMN : unsigned
    {
        KeyColumn,
        TypeColumn,
        ValueColumn,
    };

    unsigned RowCount() const override { return static_cast<unsigned>(m_outline.RowCount()); }
    wxVariant Cell(unsigned row, unsigned column) const override;
    bool Look(unsigned row, unsigned column, wxDataViewItemAttr& look) const override;
    void Edit(unsigned row, unsigned column, wxVariant const& value) override;
    bool IsEditable(unsigned row, unsigned column) const override;

    comgui::Value const* ValueAt(unsigned row) const;
    void TakeWhole(comgui::Snapshot const& ticket, TicketContent::Time now);
    void TakeEach(std::vector<comgui::SnapshotDifference> const& differences, TicketContent::Time now);
    void TakeOne(comgui::SnapshotDifference const& difference, TicketContent::Time now);
    void TakeLate();
    void RefuseEdit();
    void ShowTip(std::string const& key, wxString const& title, wxString const& why);
    std::optional<std::string> ChosenPath() const;
    void SelectPath(std::string const& path);
    void Filter();
    void Toggle(unsigned row);
    void Move(wxKeyEvent& event);
    void StartFading();
    void Fade();
    void Replace(OutlineChange const& change);

    // Wherever the chosen row is then, and if it is there still, it is the chosen one.
    template <typename Action>
    void ChangeRows(Action action)
    {
        m_list->FinishEditing();
        auto const chosen = ChosenPath();
        action();
        if (chosen && ChosenPath() != chosen)
            SelectPath(*chosen);
    }

    KeyOutline m_outline;
    TicketContent m_content;
    bool m_isNew = true;                     // nothing of the ticket is known yet
    std::string m_edited;                    // the key whose value is edited
    comgui::Value m_begun;                   // that value when the edit began
    std::optional<comgui::Snapshot> m_late;  // the ticket, if rows came or went during the edit
    wxStaticText* m_heading;
    wxSearchCtrl* m_filter;
    VirtualList* m_list;
    wxTimer m_fading;
};
}  // namespace desk
