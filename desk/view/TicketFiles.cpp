#include "desk/view/TicketFiles.h"

#include "desk/model/SavedFile.h"
#include "desk/model/TicketFile.h"
#include "desk/model/TicketStream.h"
#include "desk/view/FaultText.h"
#include "desk/view/NumberText.h"
#include "desk/view/ShownText.h"
#include <comgui/client/Text.h>
#include <variant>
#include <wx/filedlg.h>
#include <wx/filefn.h>
#include <wx/intl.h>
#include <wx/msgdlg.h>

namespace desk
{
namespace
{
// Why it came to nothing, as the worker's thread has found it; the sentence is made by the window's.
using Trouble = std::variant<std::monostate, FileFault, comgui::Error>;

wxString TextOf(Trouble const& trouble)
{
    if (auto const* const fault = std::get_if<FileFault>(&trouble))
        return desk::TextOf(*fault);
    auto const* const error = std::get_if<comgui::Error>(&trouble);
    return error ? comgui::ToWx(error->Text()) : wxString();
}

struct Exported
{
    Trouble trouble;
    std::size_t keys = 0;
    std::vector<FileLoss> losses;
    Trouble unchecked{};  // why nothing is known of losses, though the file is there
};

std::variant<std::string, Trouble> BytesOf(comgui::Tickets const& tickets, comgui::TicketAddress ticket,
                                           comgui::Snapshot const& content, bool isStream)
{
    if (isStream)
    {
        auto stream = StreamOf(content);
        if (auto* const fault = std::get_if<FileFault>(&stream))
            return Trouble(std::move(*fault));
        return std::get<std::string>(std::move(stream));
    }
    auto xml = tickets.ToXml(ticket);
    if (!xml)
        return Trouble(xml.GetError());
    return *std::move(xml);
}

Exported Export(comgui::Tickets const& tickets, comgui::TicketAddress ticket, ExportFile const& file)
{
    auto const content = tickets.ReadAll(ticket, comgui::Paths::AsStored);
    if (!content)
        return {content.GetError(), 0, {}};
    bool const isStream = file.form == FileForm::Stream;
    auto const made = BytesOf(tickets, ticket, *content, isStream);
    if (auto const* const trouble = std::get_if<Trouble>(&made))
        return {*trouble, 0, {}};
    std::string const& bytes = std::get<std::string>(made);
    // The server has made the XML of what the ticket was later: hence the second look at it.
    auto const after = isStream ? content : tickets.ReadAll(ticket, comgui::Paths::AsStored);
    if (auto const fault = SaveFile(file.name, bytes))
        return {*fault, 0, {}};
    std::size_t const keys = content->Entries().size();
    if (!after)
        return {{}, keys, {}, after.GetError()};
    auto losses = LossesOf(*content, *after, bytes);
    if (auto const* const fault = std::get_if<FileFault>(&losses))
        return {{}, keys, {}, *fault};
    return {{}, keys, std::get<std::vector<FileLoss>>(std::move(losses))};
}

wxString SentenceOf(Exported const& done)
{
    if (done.trouble.index() != 0)
        return TextOf(done.trouble);
    if (done.unchecked.index() != 0)
        return wxString::Format(_("Exported, but not checked: %s"), TextOf(done.unchecked));
    if (done.losses.empty())
        return wxString::Format(wxPLURAL("Exported: %zu key", "Exported: %zu keys", PluralOf(done.keys)),
                                done.keys);
    wxString const first = ShownText(done.losses[0].key);
    std::size_t const others = done.losses.size() - 1;
    if (others == 0)
        return wxString::Format(_("Exported, but the file does not hold all of it as it is: %s"), first);
    return wxString::Format(
        wxPLURAL("Exported, but the file does not hold all of it as it is: %s and %zu more",
                 "Exported, but the file does not hold all of it as it is: %s and %zu more",
                 PluralOf(others)),
        first, others);
}

struct Imported
{
    Trouble trouble;
    comgui::TicketAddress ticket;
    std::size_t keys = 0;
    std::size_t refused = 0;
    std::string refusedKey;  // the first
};

Imported Import(comgui::Tickets const& tickets, int type, std::string const& file)
{
    auto const read = ImportTicket(file);
    if (auto const* const fault = std::get_if<FileFault>(&read))
        return {*fault, {}, 0, 0, {}};
    std::vector<comgui::KeyValue> values;
    for (comgui::SnapshotEntry const& entry : std::get<TicketOfFile>(read).ticket.Entries())
        values.push_back({entry.key, entry.value});
    auto const ticket = tickets.Create(type);
    if (!ticket)
        return {ticket.GetError(), {}, 0, 0, {}};
    Imported done{{}, *ticket, 0, 0, {}};
    auto const outcomes = tickets.WriteAll(*ticket, values, comgui::Paths::AsStored);
    for (std::size_t i = 0; i < outcomes.size(); ++i)
        if (outcomes[i])
            ++done.keys;
        else if (done.refused++ == 0)
            done.refusedKey = values[i].key;
    return done;
}

wxString SentenceOf(Imported const& done)
{
    if (done.trouble.index() != 0)
        return TextOf(done.trouble);
    if (done.refused == 0)
        return wxString::Format(wxPLURAL("Imported: %zu key", "Imported: %zu keys", PluralOf(done.keys)),
                                done.keys);
    return wxString::Format(wxPLURAL("Imported, but %zu key was refused: %s",
                                     "Imported, but %zu keys were refused, the first of them %s",
                                     PluralOf(done.refused)),
                            done.refused, ShownText(done.refusedKey));
}

// The dialog has asked about the name that was typed.
bool MayOverwrite(wxWindow* parent, std::string const& file)
{
    return !wxFileExists(comgui::ToWx(file)) ||
           wxMessageBox(wxString::Format(_("%s is there already. Overwrite it?"), ShownText(file)),
                        _("Export the ticket"), wxYES_NO | wxNO_DEFAULT | wxICON_QUESTION, parent) == wxYES;
}

// XML first: see ExportFileOf.
wxString Wildcard()
{
    return _("Ticket as XML") + " (*.xml)|*.xml|" + _("Ticket stream") + " (*.stream)|*.stream";
}

std::optional<ExportFile> AskForTarget(wxWindow* parent, wxString const& proposed)
{
    wxFileDialog dialog(parent, _("Export the ticket"), {}, proposed, Wildcard(),
                        wxFD_SAVE | wxFD_OVERWRITE_PROMPT);
    if (dialog.ShowModal() != wxID_OK)
        return std::nullopt;
    return ExportFile{comgui::ToUtf8(dialog.GetPath()),
                      dialog.GetFilterIndex() == 1 ? FileForm::Stream : FileForm::Xml};
}

std::optional<std::string> AskForSource(wxWindow* parent)
{
    wxFileDialog dialog(parent, _("Import a ticket"), {}, {}, Wildcard() + "|" + _("All files") + "|*",
                        wxFD_OPEN | wxFD_FILE_MUST_EXIST);
    if (dialog.ShowModal() != wxID_OK)
        return std::nullopt;
    return comgui::ToUtf8(dialog.GetPath());
}
}  // namespace

FileQuestions FileDialogs() { return {AskForTarget, AskForSource}; }

void ExportTicket(wxWindow* parent, FileQuestions const& questions, comgui::Tickets const& tickets,
                  comgui::Worker const& worker, comgui::TicketAddress ticket, Said said)
{
    auto const chosen = questions.askForTarget(parent, wxString::Format("%d-%d.xml", ticket.type, ticket.id));
    if (!chosen)
        return;
    ExportFile const file = ExportFileOf(chosen->name, chosen->form);
    if (file.name != chosen->name && !MayOverwrite(parent, file.name))
        return;
    worker.Do([tickets, ticket, file] { return Export(tickets, ticket, file); },
              [said = std::move(said)](Exported const& done) { said(SentenceOf(done)); });
}

void ImportTicket(wxWindow* parent, FileQuestions const& questions, comgui::Tickets const& tickets,
                  comgui::Worker const& worker, int type, std::function<void(comgui::TicketAddress)> made,
                  Said said)
{
    auto const file = questions.askForSource(parent);
    if (!file)
        return;
    worker.Do([tickets, type, file = *file] { return Import(tickets, type, file); },
              [made = std::move(made), said = std::move(said)](Imported const& done)
              {
                  if (done.trouble.index() == 0)
                      made(done.ticket);
                  said(SentenceOf(done));
              });
}
}  // namespace desk
