// A list of any length: rows are asked for when they are painted, nothing is kept for those that are not.
#pragma once

#include <functional>
#include <optional>
#include <vector>
#include <wx/dataview.h>

namespace desk
{
// What a list shows. For the window's thread; called for visible rows only.
class RowSource
{
public:
    virtual ~RowSource() = default;
    virtual unsigned RowCount() const = 0;
    virtual wxVariant Cell(unsigned row, unsigned column) const = 0;

    // How the cell is to look; false: as usual.
    virtual bool Look(unsigned, unsigned, wxDataViewItemAttr&) const { return false; }

    // What the user has put there; the cell shows what Cell says then. The row may be another one by then.
    virtual void Edit(unsigned, unsigned, wxVariant const&) {}
    virtual bool IsEditable(unsigned, unsigned) const { return false; }
};

class VirtualList : public wxDataViewCtrl
{
public:
    // name: for who reads the screen aloud, and for tests. source outlives the list.
    VirtualList(wxWindow* parent, wxString const& name, RowSource& source, long style = wxDV_ROW_LINES);
    ~VirtualList() override;

    void AddTextColumn(wxString const& title, int width, wxAlignment alignment = wxALIGN_LEFT,
                       wxDataViewCellMode mode = wxDATAVIEW_CELL_INERT);

    // To be told of every change of the rows, at once. Reset: any of them; no row is selected then. While a
    // cell is edited its own row may change, which is painted after the edit; any other change of the rows
    // ends the edit unsaved.
    void Reset();
    void RowChanged(unsigned row);
    void RowInserted(unsigned row);
    void RowDeleted(unsigned row);

    // From that row on so many went, then so many came in their place.
    void RowsReplaced(std::size_t row, std::size_t removed, std::size_t added);

    // Paints the visible rows anew, whose number is the same.
    void RowsLookDifferent();

    // A column whose cells are drawn and edited in a way of their own.
    void AddColumn(wxString const& title, int width, wxDataViewRenderer* renderer);

    unsigned RowOf(wxDataViewItem const& item) const;
    std::optional<unsigned> Selected() const;
    void SelectRow(unsigned row);
    void ShowRow(unsigned row);  // scrolls to it
    void StartEditing(unsigned row, unsigned column);
    bool IsEditing() const { return m_edited.has_value(); }
    void FinishEditing();  // as if the user had clicked elsewhere
    void CancelEditing();
    wxRect CellOf(unsigned row, unsigned column) const;

private:
    class MODEL;

    wxDataViewItem ItemOf(unsigned row) const;

    RowSource& m_source;
    wxObjectDataPtr<MODEL> m_model;
    std::optional<unsigned> m_edited;  // row
    wxDataViewColumn* m_editedColumn = nullptr;
};
}  // namespace desk
