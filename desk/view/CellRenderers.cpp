#include "desk/view/CellRenderers.h"

#include <wx/dc.h>
#include <wx/textctrl.h>

namespace desk
{
namespace
{
constexpr wxChar Closed = 0x25B8;
constexpr wxChar Open = 0x25BE;
constexpr int MostShownDepth = 64;  // a key of 2,000 slashes is still on the screen
}  // namespace

// The depth as a character, so that a cell is one text, which the list's model can hand over.
wxString OutlineCell(OutlineRow const& row, wxString const& name)
{
    auto const depth = std::min<std::size_t>(row.depth, MostShownDepth);
    wxChar const triangle = !row.isBranch ? ' ' : row.isOpen ? Open : Closed;
    return wxString(wxUniChar(static_cast<int>(depth) + 1)) + wxString(wxUniChar(triangle)) + name;
}

OutlineRenderer::OutlineRenderer(std::function<void(wxDataViewItem const&)> toggle)
    : wxDataViewCustomRenderer("string", wxDATAVIEW_CELL_ACTIVATABLE, wxALIGN_LEFT),
      m_toggle(std::move(toggle))
{
}

bool OutlineRenderer::SetValue(wxVariant const& value)
{
    wxString const text = value.GetString();
    if (text.length() < 2)
        return false;
    m_depth = static_cast<int>(text[0].GetValue()) - 1;
    m_triangle = static_cast<wxChar>(text[1].GetValue());
    m_name = text.substr(2);
    return true;
}

int OutlineRenderer::Indentation() const { return GetTextExtent("m").GetWidth() * (m_depth + 1) * 3 / 2; }

wxSize OutlineRenderer::GetSize() const
{
    wxSize size = GetTextExtent(m_name);
    size.IncBy(Indentation(), 0);
    return size;
}

bool OutlineRenderer::Render(wxRect cell, wxDC* dc, int state)
{
    int const indentation = Indentation();
    if (m_triangle != ' ')
        RenderText(wxUniChar(m_triangle), indentation - GetTextExtent("m").GetWidth() * 3 / 2, cell, dc,
                   state);
    RenderText(m_name, indentation, cell, dc, state);
    return true;
}

bool OutlineRenderer::ActivateCell(wxRect const&, wxDataViewModel*, wxDataViewItem const& item, unsigned,
                                   wxMouseEvent const* event)
{
    if (m_triangle == ' ' || !event || event->GetX() > Indentation())
        return false;
    m_toggle(item);
    return true;
}

ValueRenderer::ValueRenderer(std::function<wxString()> whole, std::function<void()> refuse)
    : wxDataViewCustomRenderer("string", wxDATAVIEW_CELL_EDITABLE, wxALIGN_LEFT), m_whole(std::move(whole)),
      m_refuse(std::move(refuse))
{
}

bool ValueRenderer::SetValue(wxVariant const& value)
{
    m_text = value.GetString();
    return true;
}

wxSize ValueRenderer::GetSize() const { return GetTextExtent(m_text); }

bool ValueRenderer::Render(wxRect cell, wxDC* dc, int state)
{
    RenderText(m_text, 0, cell, dc, state);
    return true;
}

wxWindow* ValueRenderer::CreateEditorCtrl(wxWindow* parent, wxRect cell, wxVariant const&)
{
    wxString const whole = m_whole();
    auto* const editor =
        new wxTextCtrl(parent, wxID_ANY, whole, cell.GetTopLeft(), cell.GetSize(), wxTE_PROCESS_ENTER);
    m_begun = editor->GetValue();
    if (m_begun != whole)
    {
        editor->Destroy();
        m_refuse();
        return nullptr;
    }
    editor->SetName("value editor");
    editor->SelectAll();
    return editor;
}

bool ValueRenderer::GetValueFromEditorCtrl(wxWindow* editor, wxVariant& value)
{
    wxString const text = static_cast<wxTextCtrl*>(editor)->GetValue();
    value = text;
    return text != m_begun;
}
}  // namespace desk
