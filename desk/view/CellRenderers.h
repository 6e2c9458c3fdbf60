// How the tree of keys and their values are drawn and edited in a list's cells.
#pragma once

#include "desk/model/KeyOutline.h"
#include <functional>
#include <wx/dataview.h>

namespace desk
{
// What a cell of the tree is given: a row's depth, its triangle and its name as one text.
wxString OutlineCell(OutlineRow const& row, wxString const& name);

// A name with its indentation, behind a triangle where keys lie below. A click on the triangle toggles it.
class OutlineRenderer : public wxDataViewCustomRenderer
{
public:
    explicit OutlineRenderer(std::function<void(wxDataViewItem const&)> toggle);

    bool SetValue(wxVariant const& value) override;
    bool GetValue(wxVariant&) const override { return false; }
    wxSize GetSize() const override;
    bool Render(wxRect cell, wxDC* dc, int state) override;
    bool ActivateCell(wxRect const& cell, wxDataViewModel* model, wxDataViewItem const& item, unsigned column,
                      wxMouseEvent const* event) override;
#if wxUSE_ACCESSIBILITY
    wxString GetAccessibleDescription() const override { return m_name; }
#endif

private:
    int Indentation() const;

    std::function<void(wxDataViewItem const&)> const m_toggle;
    int m_depth = 0;
    wxChar m_triangle = 0;  // a space: none
    wxString m_name;
};

// A value, cut in the cell; what is edited is whole.
class ValueRenderer : public wxDataViewCustomRenderer
{
public:
    // whole: the text to be edited, of the row that is edited. refuse: the editor cannot hold all of it, and
    // what is missing would be lost.
    ValueRenderer(std::function<wxString()> whole, std::function<void()> refuse);

    bool SetValue(wxVariant const& value) override;
    bool GetValue(wxVariant&) const override { return false; }
    wxSize GetSize() const override;
    bool Render(wxRect cell, wxDC* dc, int state) override;
    bool HasEditorCtrl() const override { return true; }
    wxWindow* CreateEditorCtrl(wxWindow* parent, wxRect cell, wxVariant const& value) override;
    bool GetValueFromEditorCtrl(wxWindow* editor, wxVariant& value) override;  // false: it is as it was
#if wxUSE_ACCESSIBILITY
    wxString GetAccessibleDescription() const override { return m_text; }
#endif

private:
    std::function<wxString()> const m_whole;
    std::function<void()> const m_refuse;
    wxString m_text;
    wxString m_begun;  // what the editor held before the user typed
};
}  // namespace desk
