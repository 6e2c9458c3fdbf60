// How files are to be sent: the name of the job, its queue, its copies.
#pragma once

#include <comgui/client/Transfers.h>
#include <string>
#include <vector>
#include <wx/dialog.h>

class wxChoice;
class wxSpinCtrl;
class wxTextCtrl;

namespace desk
{
struct JobQueue
{
    int id;
    std::string name;  // from the server
};

class JobOptionsDialog : public wxDialog
{
public:
    // files: at least one. A name can be given to a single one only.
    JobOptionsDialog(wxWindow* parent, std::vector<std::string> const& files, std::vector<JobQueue> queues);

    comgui::JobOptions Options() const;  // as chosen so far

private:
    std::vector<JobQueue> const m_queues;
    wxTextCtrl* m_name;
    wxChoice* m_queue;
    wxSpinCtrl* m_copies;
};
}  // namespace desk
