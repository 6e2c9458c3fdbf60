#include "tools/comgui_site/follow.h"

#include "tools/comgui_site/Interrupts.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/info.h"
#include <algorithm>
#include <poll.h>
#include <thread>
#include <unistd.h>
#include <utility>

namespace comgui_site
{
using namespace std::chrono_literals;
using standin::CommittedChange;
using standin::ParameterChange;
using standin::ProgramId;
using standin::Sequence;
using standin::Store;
using standin::TicketChange;

namespace
{
constexpr auto Pause = 200ms;  // after which a request to end is seen

char const* NameOf(TicketChange::Kind kind)
{
    switch (kind)
    {
    case TicketChange::Create:
        return "create";
    case TicketChange::Delete:
        return "delete";
    default:
        return "write";
    }
}

std::string TextOf(ParameterChange const& change)
{
    std::string const key =
        ShownKey(change.key) + (change.pos < 0 ? "" : "[" + std::to_string(change.pos) + "]");
    return change.value.type == PARAM_NONE ? key + " deleted"
                                           : key + "=" + ShownValue(change.value.ToStored());
}

// A pipe or a terminal that nobody reads any more, which a write would show only with the next change.
bool IsClosed(int output)
{
    pollfd looked{output, 0, 0};
    return poll(&looked, 1, 0) > 0 && (looked.revents & (POLLERR | POLLHUP)) != 0;
}

void TellLost(Sequence from, Sequence to, bool isJson, tools::Output& out)
{
    if (isJson)
        return out.Add(LineOf(Json{{"lost", {{"from", from}, {"to", to}}}}));
    std::fprintf(stderr,
                 "comgui_site: the journal begins with change %llu; those from %llu to %llu are gone\n",
                 static_cast<unsigned long long>(to) + 1, static_cast<unsigned long long>(from),
                 static_cast<unsigned long long>(to));
}

class Follower
{
public:
    Follower(Store& store, Sequence since, bool isJson, tools::Output& out)
        : m_store(store), m_names(store), m_isJson(isJson), m_out(out), m_heard(since)
    {
    }

    void Run()
    {
        while (!Interrupts::HaveCome() && !IsClosed(STDOUT_FILENO))
        {
            try
            {
                Step();
                m_isLost = false;
            }
            catch (standin::LostStore const& loss)
            {
                if (!std::exchange(m_isLost, true))
                    std::fprintf(stderr, "comgui_site: %s\n", Cleaned(loss.what()).c_str());
                std::this_thread::sleep_for(Pause);
            }
        }
    }

private:
    void Step()
    {
        Print();
        if (std::chrono::steady_clock::now() >= m_due)
        {
            m_store.Maintain(m_heard);
            m_due = std::chrono::steady_clock::now() + 1s;
        }
        m_store.WaitForChanges(m_heard, Pause);
    }

    // One batch of changes, so that a request to end is seen between two of them.
    void Print()
    {
        auto const take = [this](CommittedChange&& change)
        {
            std::string const& program = m_names.Of(change.program);
            m_out.Add(m_isJson ? LineOf(JsonOf(change, program)) : LineOf(change, program));
            m_heard = change.sequence;
        };
        if (!m_store.ChangesSince(m_heard, take))
        {
            Sequence const last = BeginningOfJournal(m_store) - 1;
            if (last > m_heard)  // or else the bell has yet to tell how far the site is
                TellLost(m_heard + 1, last, m_isJson, m_out);
            m_heard = std::max(m_heard, last);
        }
        m_out.Flush();
    }

    Store& m_store;
    ProgramNames m_names;
    bool const m_isJson;
    tools::Output& m_out;
    Sequence m_heard;
    std::chrono::steady_clock::time_point m_due{};  // to say how far that is
    bool m_isLost = false;
};
}  // namespace

std::string const& ProgramNames::Of(ProgramId program)
{
    if (!m_names.contains(program))
        for (auto const& known : m_store.Programs())
            m_names[known.id] = Cleaned(known.name) + " " + std::to_string(known.process);
    return m_names[program];
}

std::string LineOf(CommittedChange const& change, std::string const& program)
{
    std::string line = std::to_string(change.sequence) + "  program " + std::to_string(change.program) +
                       (program.empty() ? "" : " (" + program + ")") + "  " + NameOf(change.change.kind) +
                       "  " + TextOf(change.change.address);
    char const* separator = "  ";
    for (ParameterChange const& parameter : change.change.parameters)
        line += std::exchange(separator, ", ") + TextOf(parameter);
    return line + '\n';
}

Json JsonOf(CommittedChange const& change, std::string const& program)
{
    Json json{{"sequence", change.sequence}, {"program", change.program}};
    if (!program.empty())
        json["programName"] = JsonOf(program);
    json["kind"] = NameOf(change.change.kind);
    json["type"] = change.change.address.type;
    json["id"] = change.change.address.id;
    json["parameters"] = Json::array();
    for (ParameterChange const& parameter : change.change.parameters)
    {
        Json one{{"key", JsonOf(parameter.key)}, {"pos", parameter.pos}};
        if (parameter.value.type == PARAM_NONE)
            one["deleted"] = true;
        else
            AddValue(one, parameter.value.ToStored());
        json["parameters"].push_back(std::move(one));
    }
    return json;
}

void Follow(Store& store, std::optional<Sequence> since, bool isJson, tools::Output& out)
{
    Sequence const newest = store.Committed();
    if (since.value_or(0) > newest)
        throw Trouble("there is no change " + std::to_string(*since) + " yet; the newest is " +
                      std::to_string(newest));
    Follower(store, since.value_or(newest), isJson, out).Run();
}
}  // namespace comgui_site
