#include "desk/view/NewKeyDialog.h"

#include <comgui/client/Text.h>
#include <iterator>
#include <wx/choice.h>
#include <wx/intl.h>
#include <wx/sizer.h>
#include <wx/stattext.h>
#include <wx/textctrl.h>

namespace desk
{
namespace
{
// Those that somebody can type; a list is one of texts.
constexpr PARAM_TYPE Types[] = {PARAM_STRING,   PARAM_INT,        PARAM_DOUBLE,    PARAM_INT64,
                                PARAM_UNSIGNED, PARAM_UNSIGNED64, PARAM_BINSTRING, PARAM_COUNT};
}  // namespace

NewKeyDialog::NewKeyDialog(wxWindow* parent, std::string const& beside,
                           std::function<bool(std::string const& key)> isThere)
    : wxDialog(parent, wxID_ANY, _("New key"), wxDefaultPosition, wxDefaultSize,
               wxDEFAULT_DIALOG_STYLE | wxRESIZE_BORDER),
      m_isThere(std::move(isThere))
{
    SetName("new key");
    std::string const branch = beside.substr(0, beside.rfind('/') + 1);
    m_name = new wxTextCtrl(this, wxID_ANY, comgui::ToWx(branch));
    m_name->SetName("key");
    m_type = new wxChoice(this, wxID_ANY);
    m_type->SetName("type");
    for (PARAM_TYPE const type : Types)
        m_type->Append(wxGetTranslation(comgui::NameOf(type), "comgui"));
    m_type->SetSelection(0);
    m_text = new wxTextCtrl(this, wxID_ANY);
    m_text->SetName("value");
    m_message = new wxStaticText(this, wxID_ANY, {});
    m_message->SetName("message");

    auto* const fields = new wxFlexGridSizer(2, FromDIP(wxSize(8, 8)));
    fields->AddGrowableCol(1);
    auto const add = [this, fields](wxString const& label, wxWindow* field)
    {
        fields->Add(new wxStaticText(this, wxID_ANY, label), wxSizerFlags().CenterVertical());
        fields->Add(field, wxSizerFlags(1).Expand());
    };
    add(_("&Key:"), m_name);
    add(_("&Type:"), m_type);
    add(_("&Value:"), m_text);
    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(fields, wxSizerFlags().Expand().DoubleBorder());
    all->Add(m_message, wxSizerFlags(1).Expand().DoubleBorder(wxLEFT | wxRIGHT));
    all->Add(CreateButtonSizer(wxOK | wxCANCEL), wxSizerFlags().Expand().DoubleBorder());
    m_name->SetMinSize(FromDIP(wxSize(360, -1)));
    SetSizerAndFit(all);
    m_name->SetInsertionPointEnd();
    Bind(
        wxEVT_BUTTON, [this](auto&) { Accept(); }, wxID_OK);
}

void NewKeyDialog::Accept()
{
    m_key = comgui::ToUtf8(m_name->GetValue());
    auto const value = comgui::FromText(comgui::ToUtf8(m_text->GetValue()), Types[m_type->GetSelection()]);
    if (m_key.empty())
        m_message->SetLabelText(_("A key has a name."));
    else if (m_isThere(m_key))
        m_message->SetLabelText(_("The ticket has this key already: edit its value."));
    else if (!value)
        m_message->SetLabelText(comgui::ToWx(value.GetError().Text()));
    else
    {
        m_value = *value;
        EndModal(wxID_OK);
    }
}
}  // namespace desk
