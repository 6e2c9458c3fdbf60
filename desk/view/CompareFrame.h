// Two tickets side by side, kept up to date: all keys, or only those that differ.
#pragma once

#include "desk/model/TicketComparison.h"
#include "desk/view/VirtualList.h"
#include <comgui/client.h>
#include <optional>
#include <wx/checkbox.h>
#include <wx/frame.h>
#include <wx/stattext.h>

namespace desk
{
class CompareFrame : public wxFrame, private RowSource
{
public:
    // The connection and the worker outlive the frame.
    CompareFrame(wxWindow* parent, comgui::Connection& connection, comgui::Worker const& worker,
                 comgui::TicketAddress left, comgui::TicketAddress right);

private:
    enum COLUMN : unsigned
    {
        KeyColumn,
        LeftColumn,
        RightColumn,
    };

    unsigned RowCount() const override { return static_cast<unsigned>(m_comparison.Rows()); }
    wxVariant Cell(unsigned row, unsigned column) const override;
    bool Look(unsigned row, unsigned column, wxDataViewItemAttr& look) const override;

    void Take(Side side, comgui::TicketUpdate const& update);
    void ShowCounts();

    TicketComparison m_comparison{{}, {}};
    comgui::Error m_failures[2];  // by Side; code 0: none
    wxCheckBox* m_onlyDifferences;
    wxStaticText* m_counts;
    VirtualList* m_rows;
    std::optional<comgui::LiveTicket> m_left;
    std::optional<comgui::LiveTicket> m_right;
};
}  // namespace desk
