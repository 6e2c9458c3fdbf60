// Single tickets of the plug-in's factory: in memory, and in files.
#include "tools/comgui_validate/Memory.h"
#include "tools/comgui_validate/checks/values.h"

#include <cstdlib>
#include <filesystem>
#include <system_error>
#include <unistd.h>

namespace validate
{
namespace
{
namespace fs = std::filesystem;

void Factory(Trial& trial)
{
    auto const* const factory = trial.GetModule().table.STicketFactory;
    trial.Calling("nothing: the word STicketFactory of the table");
    trial.Expect("F1", factory, "null", "the address of the block");
    trial.Expect("F1", factory->CreateTicket, "CreateTicket is null", "a function");
    trial.Expect("F1", factory->DestroyTicket, "DestroyTicket is null", "a function");
}

void Empty(Trial& trial)
{
    STicketFactory const& factory = FactoryOf(trial);
    trial.Calling("CreateTicket(null)");
    STICKET_ACCESS const* ticket = factory.CreateTicket(nullptr);
    trial.Expect("F2", ticket, "null", "a ticket in memory");
    int calls = 0;
    WithTable(trial, ticket)
        .Walk(
            [&calls](std::string const&, PARAM_TYPE type, void const*, int)
            {
                calls += comgui::detail::IsParameter(type) ? 1 : 0;
                return true;
            });
    trial.Expect("F2", calls == 0, std::to_string(calls) + " values", "an empty ticket");
    factory.DestroyTicket(&ticket);
}

void EachType(Trial& trial)
{
    MemoryTicket const ticket(trial);
    WithTable subject(trial, ticket.Table());
    ExpectEachTypeBack(subject, true);
}

void AppendInMemory(Trial& trial)
{
    MemoryTicket const ticket(trial);
    WithTable subject(trial, ticket.Table());
    Append(subject);
}

void Walk(Trial& trial)
{
    MemoryTicket const ticket(trial);
    MemoryTicket const other(trial);
    WithTable subject(trial, ticket.Table());
    WithTable copy(trial, other.Table());
    WalkGivesEachValue(subject);
    subject.Forget();
    WalkCanBeCopied(subject, copy);
}

void Two(Trial& trial)
{
    MemoryTicket const first(trial);
    MemoryTicket const second(trial);
    WithTable one(trial, first.Table());
    WithTable two(trial, second.Table());
    one.ExpectWrite("V2", Key("A"), Int(1));
    two.ExpectNothing("F3", Key("A"), PARAM_INT);
    two.ExpectWrite("V2", Key("A"), Int(2));
    one.ExpectValue("F3", Key("A"), Int(1));
}

void Destroy(Trial& trial)
{
    STicketFactory const& factory = FactoryOf(trial);
    MemoryTicket const stays(trial);
    STICKET_ACCESS const* ticket = factory.CreateTicket(nullptr);
    if (!ticket)
        throw Skipped("the ticket factory gives no ticket; see memory.empty");
    STICKET_ACCESS const* const before = ticket;
    trial.Calling("DestroyTicket(&ticket)");
    factory.DestroyTicket(&ticket);
    trial.Expect("F6", !ticket || ticket == before, "another ticket in the caller's pointer",
                 "null, or an untouched pointer");
    WithTable subject(trial, stays.Table());
    subject.ExpectWrite("F6", Key("A"), Int(1));
    subject.ExpectValue("F6", Key("A"), Int(1));
}

void Missing(Trial& trial)
{
    STicketFactory const& factory = FactoryOf(trial);
    trial.Calling("CreateTicket(\"/nonexistent/ticket.xml\")");
    STICKET_ACCESS const* ticket = factory.CreateTicket("/nonexistent/ticket.xml");
    bool const isRefused = !ticket;
    if (ticket)
        factory.DestroyTicket(&ticket);
    trial.Expect("F4", isRefused, "a ticket", "null, since there is no such file");
}

// A copy of the file that the user has named, in a folder of its own.
class CopiedFile
{
public:
    explicit CopiedFile(Trial const& trial)
    {
        if (!trial.HasOption("ticket-file"))
            throw Skipped("no ticket file; name one with --option ticket-file=PATH");
        std::string folder = fs::temp_directory_path() / "comgui-validate-XXXXXX";
        if (!mkdtemp(folder.data()))
            throw Skipped("no folder for a copy of the ticket file can be made in " +
                          fs::temp_directory_path().string());
        m_folder = folder;
        fs::path const source = trial.Option("ticket-file", "");
        std::error_code failure;
        fs::copy_file(source, m_folder / source.filename(), failure);
        if (failure)
            throw Skipped("the ticket file " + source.string() + " cannot be copied: " + failure.message());
        m_path = m_folder / source.filename();
    }
    ~CopiedFile()
    {
        std::error_code ignored;
        fs::remove_all(m_folder, ignored);
    }
    CopiedFile(CopiedFile const&) = delete;
    CopiedFile& operator=(CopiedFile const&) = delete;

    std::string Path() const { return m_path; }

private:
    fs::path m_folder;
    fs::path m_path;
};

void OpenFile(Trial& trial)
{
    CopiedFile const file(trial);
    STicketFactory const& factory = FactoryOf(trial);
    trial.Calling("CreateTicket(" + Quoted(file.Path()) + ")");
    STICKET_ACCESS const* ticket = factory.CreateTicket(file.Path().c_str());
    trial.Expect("F4", ticket, "null", "the ticket of the file");
    factory.DestroyTicket(&ticket);
}

void ChangeFile(Trial& trial)
{
    CopiedFile const file(trial);
    Value const text = Text("what was written");
    {
        MemoryTicket ticket(trial, file.Path());
        {
            WithTable subject(trial, ticket.Table());
            subject.ExpectWrite("V2", Key("Kept"), text);
            subject.Keep();
        }
        ticket.Destroy();
    }
    MemoryTicket const ticket(trial, file.Path());
    WithTable subject(trial, ticket.Table());
    subject.ExpectValue("F5", Key("Kept"), text);
}
}  // namespace

std::vector<Check> MemoryChecks()
{
    return {
        {"memory.factory", Factory},       {"memory.empty", Empty},    {"memory.each-type", EachType},
        {"memory.append", AppendInMemory}, {"memory.walk", Walk},      {"memory.two", Two},
        {"memory.destroy", Destroy},       {"files.missing", Missing}, {"files.open", OpenFile},
        {"files.change", ChangeFile},
    };
}
}  // namespace validate
