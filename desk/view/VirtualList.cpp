#include "desk/view/VirtualList.h"

#include <algorithm>

namespace desk
{
class VirtualList::MODEL : public wxDataViewVirtualListModel
{
public:
    explicit MODEL(RowSource& source) : wxDataViewVirtualListModel(source.RowCount()), m_source(source) {}

#if !wxCHECK_VERSION(3, 3, 0)
    unsigned int GetColumnCount() const override { return 0; }  // abstract, and never asked
    wxString GetColumnType(unsigned int) const override { return "string"; }
#endif
    void GetValueByRow(wxVariant& value, unsigned row, unsigned column) const override
    {
        value = row < m_source.RowCount() ? m_source.Cell(row, column) : wxVariant(wxString());
    }
    bool SetValueByRow(wxVariant const& value, unsigned row, unsigned column) override
    {
        m_source.Edit(row, column, value);
        return false;
    }
    bool GetAttrByRow(unsigned row, unsigned column, wxDataViewItemAttr& look) const override
    {
        return row < m_source.RowCount() && m_source.Look(row, column, look);
    }
    bool IsEnabledByRow(unsigned, unsigned) const override { return true; }

private:
    RowSource& m_source;
};

VirtualList::VirtualList(wxWindow* parent, wxString const& name, RowSource& source, long style)
    : wxDataViewCtrl(parent, wxID_ANY, wxDefaultPosition, wxDefaultSize, style), m_source(source),
      m_model(new MODEL(source))
{
    SetName(name);
    AssociateModel(m_model.get());
    Bind(wxEVT_DATAVIEW_ITEM_START_EDITING,
         [this](wxDataViewEvent& event)
         {
             unsigned const row = m_model->GetRow(event.GetItem());
             if (row >= m_source.RowCount() || event.GetColumn() < 0 ||
                 !m_source.IsEditable(row, static_cast<unsigned>(event.GetColumn())))
                 event.Veto();
         });
    Bind(wxEVT_DATAVIEW_ITEM_EDITING_STARTED,
         [this](wxDataViewEvent& event)
         {
             m_edited = m_model->GetRow(event.GetItem());
             m_editedColumn = event.GetDataViewColumn();
             event.Skip();
         });
    Bind(wxEVT_DATAVIEW_ITEM_EDITING_DONE,
         [this](wxDataViewEvent& event)
         {
             m_edited.reset();
             CallAfter([this] { RowsLookDifferent(); });
             event.Skip();
         });
}

// The control ends an edit with an event when its destructor runs, and those who listen may be gone by then.
VirtualList::~VirtualList() { SetEvtHandlerEnabled(false); }

void VirtualList::AddTextColumn(wxString const& title, int width, wxAlignment alignment,
                                wxDataViewCellMode mode)
{
    AppendTextColumn(title, GetColumnCount(), mode, FromDIP(width), alignment, wxDATAVIEW_COL_RESIZABLE);
}

void VirtualList::AddColumn(wxString const& title, int width, wxDataViewRenderer* renderer)
{
    AppendColumn(new wxDataViewColumn(title, renderer, GetColumnCount(), FromDIP(width), wxALIGN_LEFT,
                                      wxDATAVIEW_COL_RESIZABLE));
}

// What was selected may be another row now, or none: only the owner knows.
void VirtualList::Reset()
{
    UnselectAll();
    m_model->Reset(m_source.RowCount());
}

// GTK takes a change of the edited row for the end of the edit.
void VirtualList::RowChanged(unsigned row)
{
    if (row != m_edited)
        m_model->RowChanged(row);
}

void VirtualList::RowInserted(unsigned row) { m_model->RowInserted(row); }
void VirtualList::RowDeleted(unsigned row) { m_model->RowDeleted(row); }

void VirtualList::RowsReplaced(std::size_t row, std::size_t removed, std::size_t added)
{
    constexpr std::size_t Few = 64;  // each costs a notice; all anew costs as much as some dozens
    if (removed + added > Few)
        return Reset();
    auto const first = static_cast<unsigned>(row);
    for (std::size_t i = 0; i < removed; ++i)
        RowDeleted(first);
    for (std::size_t i = 0; i < added; ++i)
        RowInserted(first + static_cast<unsigned>(i));
}

// wxGTK asks for cells again only where it is told that a row has changed.
void VirtualList::RowsLookDifferent()
{
    wxDataViewItem const top = GetTopItem();
    if (!top.IsOk())
        return;
    unsigned const first = m_model->GetRow(top);
    unsigned const end = std::min(m_source.RowCount(), first + static_cast<unsigned>(GetCountPerPage()) + 2);
    for (unsigned row = first; row < end; ++row)
        RowChanged(row);
}

unsigned VirtualList::RowOf(wxDataViewItem const& item) const { return m_model->GetRow(item); }

std::optional<unsigned> VirtualList::Selected() const
{
    wxDataViewItem const item = GetSelection();
    return item.IsOk() ? std::optional(m_model->GetRow(item)) : std::nullopt;
}

void VirtualList::SelectRow(unsigned row)
{
    UnselectAll();
    Select(ItemOf(row));
    SetCurrentItem(ItemOf(row));
    EnsureVisible(ItemOf(row));
}

void VirtualList::ShowRow(unsigned row) { EnsureVisible(ItemOf(row)); }

void VirtualList::StartEditing(unsigned row, unsigned column)
{
    EnsureVisible(ItemOf(row), GetColumn(column));
    EditItem(ItemOf(row), GetColumn(column));
}

void VirtualList::FinishEditing()
{
    if (m_edited)
        m_editedColumn->GetRenderer()->FinishEditing();
}

void VirtualList::CancelEditing()
{
    if (m_edited)
        m_editedColumn->GetRenderer()->CancelEditing();
}

wxRect VirtualList::CellOf(unsigned row, unsigned column) const
{
    return GetItemRect(ItemOf(row), GetColumn(column));
}

wxDataViewItem VirtualList::ItemOf(unsigned row) const { return m_model->GetItem(row); }
}  // namespace desk
