// Asks for a new key of a ticket: its name, its type and its value.
#pragma once

#include <comgui/client.h>
#include <functional>
#include <string>
#include <wx/dialog.h>

class wxChoice;
class wxStaticText;
class wxTextCtrl;

namespace desk
{
class NewKeyDialog : public wxDialog
{
public:
    // beside: a key whose branch the new one is likely to belong to; may be empty. isThere: whether the
    // ticket has that key, which then is not a new one.
    NewKeyDialog(wxWindow* parent, std::string const& beside,
                 std::function<bool(std::string const& key)> isThere);

    // After ShowModal has returned wxID_OK.
    std::string const& Key() const { return m_key; }
    comgui::Value const& Value() const { return m_value; }

private:
    void Accept();

    std::function<bool(std::string const& key)> const m_isThere;
    std::string m_key;
    comgui::Value m_value;
    wxTextCtrl* m_name;
    wxChoice* m_type;
    wxTextCtrl* m_text;
    wxStaticText* m_message;
};
}  // namespace desk
