#include "desk/view/CompareFrame.h"

#include "desk/model/DisplayText.h"
#include "desk/view/Theme.h"
#include <comgui/client/Text.h>
#include <wx/sizer.h>

namespace desk
{
namespace
{
constexpr std::size_t KeyLength = 400;    // characters in a cell
constexpr std::size_t ValueLength = 200;  // likewise
constexpr std::size_t FewChanges = 16;    // shown one by one

wxString NameOf(comgui::TicketAddress ticket) { return wxString::Format("%d/%d", ticket.type, ticket.id); }
}  // namespace

CompareFrame::CompareFrame(wxWindow* parent, comgui::Connection& connection, comgui::Worker const& worker,
                           comgui::TicketAddress left, comgui::TicketAddress right)
    : wxFrame(parent, wxID_ANY, wxString::Format(_("%s and %s"), NameOf(left), NameOf(right)),
              wxDefaultPosition, parent->FromDIP(wxSize(900, 600)))
{
    SetName("compare");
    m_onlyDifferences = new wxCheckBox(this, wxID_ANY, _("Only &differences"));
    m_onlyDifferences->SetName("only differences");
    m_onlyDifferences->SetValue(true);
    m_comparison.Show(RowFilter::Differences);
    m_counts = new wxStaticText(this, wxID_ANY, {});
    m_rows = new VirtualList(this, "compared keys", *this);
    m_rows->AddTextColumn(_("Key"), 300);
    m_rows->AddTextColumn(NameOf(left), 280);
    m_rows->AddTextColumn(NameOf(right), 280);

    auto* const top = new wxBoxSizer(wxHORIZONTAL);
    top->Add(m_onlyDifferences, wxSizerFlags().CenterVertical().Border());
    top->Add(m_counts, wxSizerFlags(1).CenterVertical().Border());
    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(top, wxSizerFlags().Expand());
    all->Add(m_rows, wxSizerFlags(1).Expand());
    SetSizer(all);
    m_onlyDifferences->Bind(wxEVT_CHECKBOX,
                            [this](wxCommandEvent& event)
                            {
                                m_comparison.Show(event.IsChecked() ? RowFilter::Differences
                                                                    : RowFilter::All);
                                m_rows->Reset();
                            });
    Bind(wxEVT_CHAR_HOOK, [this](wxKeyEvent& event)
         { event.GetKeyCode() == WXK_ESCAPE ? static_cast<void>(Close()) : event.Skip(); });
    m_left.emplace(connection, worker, left,
                   [this](comgui::TicketUpdate const& update) { Take(Side::Left, update); });
    m_right.emplace(connection, worker, right,
                    [this](comgui::TicketUpdate const& update) { Take(Side::Right, update); });
}

wxVariant CompareFrame::Cell(unsigned row, unsigned column) const
{
    ComparedRow const compared = m_comparison.Row(row);
    if (column == KeyColumn)
        return comgui::ToWx(DisplayText(compared.key, KeyLength));
    comgui::Value const* const value = column == LeftColumn ? compared.left : compared.right;
    return value ? comgui::ToWx(DisplayTextOf(*value, ValueLength)) : wxString();
}

bool CompareFrame::Look(unsigned row, unsigned column, wxDataViewItemAttr& look) const
{
    RowState const state = m_comparison.Row(row).state;
    bool const isMarked = state == RowState::Different ||
                          (state == RowState::OnlyLeft && column != RightColumn) ||
                          (state == RowState::OnlyRight && column != LeftColumn);
    if (isMarked && column != KeyColumn)
        look.SetBackgroundColour(ColourOf(Accent::Difference));
    return isMarked && column != KeyColumn;
}

void CompareFrame::Take(Side side, comgui::TicketUpdate const& update)
{
    m_failures[static_cast<int>(side)] = update.outcome ? comgui::Error() : update.outcome.GetError();
    if (update.differences.size() > FewChanges)
    {
        std::vector<comgui::KeyValue> changes;
        for (comgui::SnapshotDifference const& difference : update.differences)
            changes.push_back({difference.key, difference.after.value_or(comgui::Value())});
        m_comparison.UpdateAll(side, changes);
        m_rows->Reset();
    }
    else
        for (comgui::SnapshotDifference const& difference : update.differences)
        {
            RowChange const change = m_comparison.Update(side, difference.key, difference.after);
            auto const row = static_cast<unsigned>(change.row);
            if (change.kind == RowChange::Inserted)
                m_rows->RowInserted(row);
            else if (change.kind == RowChange::Removed)
                m_rows->RowDeleted(row);
            else if (change.kind == RowChange::Changed)
                m_rows->RowChanged(row);
        }
    ShowCounts();
}

void CompareFrame::ShowCounts()
{
    for (comgui::Error const& failure : m_failures)
        if (failure.code != 0)
            return m_counts->SetLabelText(comgui::ToWx(failure.Text()));
    m_counts->SetLabelText(
        wxString::Format(_("%zu different, %zu only left, %zu only right, %zu equal"),
                         m_comparison.Count(RowState::Different), m_comparison.Count(RowState::OnlyLeft),
                         m_comparison.Count(RowState::OnlyRight), m_comparison.Count(RowState::Equal)));
}
}  // namespace desk
