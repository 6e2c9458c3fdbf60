// Asks where to log in and as whom, tests the server, and stays until the login has succeeded or the user
// gives up.
#pragma once

#include <comgui/client.h>
#include <memory>
#include <optional>
#include <string>
#include <vector>
#include <wx/combobox.h>
#include <wx/dialog.h>
#include <wx/stattext.h>

class wxButton;
class wxTextCtrl;

namespace desk
{
class LoginDialog : public wxDialog
{
public:
    // servers: what was used before, the newest first. The connection and the worker outlive the dialog.
    LoginDialog(wxWindow* parent, comgui::Connection& connection, comgui::Worker const& worker,
                std::vector<std::string> const& servers, std::string const& user);

    // Shows why it is needed: a login that was refused, a session that has ended.
    void Explain(std::string const& why);

    // A login that the user gives up is undone on the worker's thread, before anything given to it
    // afterwards.
    int ShowModal() override;

    // After ShowModal has returned wxID_OK.
    comgui::User const& User() const { return *m_user; }
    comgui::Server const& Server() const { return m_server; }

private:
    struct Attempt;

    void Test();
    void LogIn();
    void Answered(comgui::Result<comgui::User> const& user);
    void GiveUp();
    bool TakeServer();
    void SetBusy(bool isBusy);
    void Say(wxString const& text);

    comgui::Connection& m_connection;
    comgui::Worker const& m_worker;
    comgui::Server m_server;
    std::optional<comgui::User> m_user;
    std::shared_ptr<Attempt> m_attempt;  // to log in, that is under way
    wxComboBox* m_serverField;
    wxTextCtrl* m_userField;
    wxTextCtrl* m_passwordField;
    wxButton* m_test;
    wxButton* m_logIn;
    wxStaticText* m_message;
};
}  // namespace desk
