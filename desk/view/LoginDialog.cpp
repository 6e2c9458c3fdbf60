#include "desk/view/LoginDialog.h"

#include "desk/model/ServerName.h"
#include <atomic>
#include <utility>
#include <wx/button.h>
#include <wx/sizer.h>
#include <wx/textctrl.h>
#include <wx/weakref.h>

namespace desk
{
namespace
{
constexpr int Width = 380;  // in pixels of a plain screen
}

struct LoginDialog::Attempt
{
    std::atomic<bool> isGivenUp{false};
    bool hasEntered = false;  // of the worker's thread
};

LoginDialog::LoginDialog(wxWindow* parent, comgui::Connection& connection, comgui::Worker const& worker,
                         std::vector<std::string> const& servers, std::string const& user)
    : wxDialog(parent, wxID_ANY, _("Log in"), wxDefaultPosition, wxDefaultSize,
               wxDEFAULT_DIALOG_STYLE | wxRESIZE_BORDER),
      m_connection(connection), m_worker(worker)
{
    wxArrayString names;
    for (std::string const& server : servers)
        names.Add(comgui::ToWx(server));
    m_serverField = new wxComboBox(this, wxID_ANY, names.empty() ? wxString("localhost") : names[0],
                                   wxDefaultPosition, wxDefaultSize, names);
    m_userField = new wxTextCtrl(this, wxID_ANY, comgui::ToWx(user));
    m_passwordField = new wxTextCtrl(this, wxID_ANY, {}, wxDefaultPosition, wxDefaultSize, wxTE_PASSWORD);
    m_test = new wxButton(this, wxID_ANY, _("&Test"));
    m_logIn = new wxButton(this, wxID_OK, _("&Log in"));
    m_message = new wxStaticText(this, wxID_ANY, {});
    SetName("login");
    m_message->SetName("message");
    m_serverField->SetName("server");
    m_userField->SetName("user");
    m_passwordField->SetName("password");

    auto* const fields = new wxFlexGridSizer(3, FromDIP(wxSize(8, 8)));
    fields->AddGrowableCol(1);
    auto const add = [this, fields](wxString const& label, wxWindow* field, wxWindow* button)
    {
        fields->Add(new wxStaticText(this, wxID_ANY, label), wxSizerFlags().CenterVertical());
        fields->Add(field, wxSizerFlags(1).Expand());
        button ? fields->Add(button) : fields->AddStretchSpacer();
    };
    add(_("&Server:"), m_serverField, m_test);
    add(_("&User:"), m_userField, nullptr);
    add(_("&Password:"), m_passwordField, nullptr);
    auto* const buttons = new wxStdDialogButtonSizer;
    buttons->AddButton(m_logIn);
    buttons->AddButton(new wxButton(this, wxID_CANCEL));
    buttons->Realize();
    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(fields, wxSizerFlags().Expand().DoubleBorder());
    all->Add(m_message, wxSizerFlags(1).Expand().DoubleBorder(wxLEFT | wxRIGHT));
    all->Add(buttons, wxSizerFlags().Expand().DoubleBorder());
    m_message->SetMinSize(FromDIP(wxSize(Width, 48)));
    SetSizerAndFit(all);
    m_logIn->SetDefault();
    (user.empty() ? m_userField : m_passwordField)->SetFocus();

    m_test->Bind(wxEVT_BUTTON, [this](auto&) { Test(); });
    m_logIn->Bind(wxEVT_BUTTON, [this](auto&) { LogIn(); });
}

void LoginDialog::Explain(std::string const& why) { Say(comgui::ToWx(why)); }

void LoginDialog::Test()
{
    if (!TakeServer())
        return;
    SetBusy(true);
    Say(_("Asking the server ..."));
    m_worker.Do([&connection = m_connection, server = m_server] { return connection.Test(server); },
                [self = wxWeakRef<LoginDialog>(this)](comgui::Outcome const& outcome)
                {
                    if (!self)
                        return;
                    self->SetBusy(false);
                    self->Say(outcome ? _("The server answers.") : comgui::ToWx(outcome.GetError().Text()));
                });
}

void LoginDialog::LogIn()
{
    if (!TakeServer())
        return;
    SetBusy(true);
    Say(_("Logging in ..."));
    comgui::Account const account{comgui::ToUtf8(m_userField->GetValue()),
                                  comgui::ToUtf8(m_passwordField->GetValue())};
    m_attempt = std::make_shared<Attempt>();
    m_worker.Do(
        [&connection = m_connection, server = m_server, account,
         attempt = m_attempt]() -> comgui::Result<comgui::User>
        {
            if (attempt->isGivenUp)  // before it has ended the session that is there
                return comgui::Error{comgui::Cancelled, account.user, {}};
            auto user = connection.LogIn(server, account);
            attempt->hasEntered = user.IsGood();
            return user;
        },
        [self = wxWeakRef<LoginDialog>(this)](comgui::Result<comgui::User> const& user)
        {
            if (self && self->IsModal())
                self->Answered(user);
        });
}

int LoginDialog::ShowModal()
{
    int const answer = wxDialog::ShowModal();
    GiveUp();
    return answer;
}

// The worker's order is what keeps this logout from ending another login than the one given up.
void LoginDialog::GiveUp()
{
    if (!m_attempt)
        return;
    m_attempt->isGivenUp = true;
    m_worker.Do(
        [&connection = m_connection, attempt = std::exchange(m_attempt, nullptr)]
        {
            if (attempt->hasEntered)
                (void)connection.LogOut();
        },
        [] {});
}

void LoginDialog::Answered(comgui::Result<comgui::User> const& user)
{
    SetBusy(false);
    m_attempt.reset();
    if (user)
    {
        m_user = *user;
        EndModal(wxID_OK);
        return;
    }
    Say(comgui::ToWx(user.GetError().Text()));
    m_passwordField->SetFocus();
    m_passwordField->SelectAll();
}

bool LoginDialog::TakeServer()
{
    auto const server = ServerFromText(comgui::ToUtf8(m_serverField->GetValue()));
    if (!server)
    {
        Say(_("A server is a name or an address, with a port if it is not the usual one: press-7:50001."));
        m_serverField->SetFocus();
        return false;
    }
    m_server = *server;
    return true;
}

void LoginDialog::SetBusy(bool isBusy)
{
    for (wxWindow* const each :
         std::initializer_list<wxWindow*>{m_serverField, m_userField, m_passwordField, m_test, m_logIn})
        each->Enable(!isBusy);
}

void LoginDialog::Say(wxString const& text)
{
    m_message->SetLabelText(text);
    m_message->Wrap(m_message->GetSize().GetWidth());
    Layout();
}
}  // namespace desk
