#include "desk/view/JobOptionsDialog.h"

#include "desk/view/NumberText.h"
#include "desk/view/ShownText.h"
#include <comgui/client/Text.h>
#include <comgui/client/TicketAddress.h>
#include <wx/choice.h>
#include <wx/filename.h>
#include <wx/intl.h>
#include <wx/sizer.h>
#include <wx/spinctrl.h>
#include <wx/stattext.h>
#include <wx/textctrl.h>

namespace desk
{
namespace
{
constexpr int GreatestCopies = 9999;
constexpr unsigned long GreatestName = 255;
constexpr std::size_t QueueName = 60;

// Its number first: the name may be unknown, or that of several.
wxString LabelOf(JobQueue const& queue)
{
    wxString const number = wxString::Format("%d/%d", comgui::QueueTickets, queue.id);
    return queue.name.empty() ? number : number + " " + ShownText(queue.name, QueueName);
}
}  // namespace

JobOptionsDialog::JobOptionsDialog(wxWindow* parent, std::vector<std::string> const& files,
                                   std::vector<JobQueue> queues)
    : wxDialog(parent, wxID_ANY, _("Send job"), wxDefaultPosition, wxDefaultSize,
               wxDEFAULT_DIALOG_STYLE | wxRESIZE_BORDER, "job options"),
      m_queues(std::move(queues))
{
    // Each label is made before its control: that is how readers of the screen find it.
    auto* const grid = new wxFlexGridSizer(2, FromDIP(wxSize(8, 8)));
    grid->AddGrowableCol(1);
    auto const add = [this, grid](wxString const& label, auto const& make)
    {
        grid->Add(new wxStaticText(this, wxID_ANY, label), wxSizerFlags().CentreVertical());
        auto* const control = make();
        grid->Add(control, wxSizerFlags(1).Expand());
        return control;
    };
    wxString const name =
        files.size() == 1
            ? wxFileName(comgui::ToWx(files[0])).GetFullName()
            : wxString::Format(
                  wxPLURAL("%zu file with its name", "%zu files, each with its name", PluralOf(files.size())),
                  files.size());
    m_name = add(_("&Name:"), [&] { return new wxTextCtrl(this, wxID_ANY, name); });
    m_queue = add(_("&Queue:"), [&] { return new wxChoice(this, wxID_ANY); });
    m_copies = add(_("&Copies:"),
                   [&]
                   {
                       return new wxSpinCtrl(this, wxID_ANY, {}, wxDefaultPosition, wxDefaultSize,
                                             wxSP_ARROW_KEYS, 1, GreatestCopies, 1);
                   });
    m_name->SetName("name");
    m_name->SetMaxLength(GreatestName);
    m_name->SetMinSize(FromDIP(wxSize(280, -1)));
    m_name->Enable(files.size() == 1);
    m_queue->SetName("queue");
    m_queue->Append(_("As the server chooses"));
    for (JobQueue const& queue : m_queues)
        m_queue->Append(LabelOf(queue));
    m_queue->SetSelection(0);
    m_copies->SetName("copies");

    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(grid, wxSizerFlags(1).Expand().DoubleBorder());
    all->Add(CreateStdDialogButtonSizer(wxOK | wxCANCEL), wxSizerFlags().Expand().Border());
    SetSizerAndFit(all);
}

comgui::JobOptions JobOptionsDialog::Options() const
{
    comgui::JobOptions options;
    if (m_name->IsEnabled())
        options.name = comgui::ToUtf8(m_name->GetValue().Trim().Trim(false));
    if (int const chosen = m_queue->GetSelection(); chosen > 0)
        options.queue = m_queues[static_cast<std::size_t>(chosen) - 1].id;
    options.copies = m_copies->GetValue();
    return options;
}
}  // namespace desk
