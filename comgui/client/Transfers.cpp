#include "comgui/client/Transfers.h"

#include "comgui/client/Client.h"
#include "comgui/client/TransferPool.h"

namespace comgui
{
using detail::TransferTask;

int Transfer::Number() const { return m_task->number; }
std::string Transfer::Source() const { return m_task->source; }
std::string Transfer::Target() const { return m_task->target; }
TransferProgress Transfer::Progress() const { return m_task->pool->Look(*m_task, &TransferTask::progress); }
bool Transfer::IsOver() const { return m_task->pool->Look(*m_task, &TransferTask::outcome).has_value(); }
void Transfer::Cancel() { m_task->pool->Cancel(*m_task); }
Outcome Transfer::Wait() const { return *m_task->pool->WaitFor(*m_task, std::nullopt); }
std::optional<Outcome> Transfer::WaitFor(std::chrono::milliseconds time) const
{
    return m_task->pool->WaitFor(*m_task, time);
}
std::optional<int> Transfer::Job() const { return m_task->pool->Look(*m_task, &TransferTask::job); }

Transfer Transfers::SendJob(std::string const& local, JobOptions const& options) const
{
    std::string const name = options.name.empty() ? ComGUIManager::LeafName(local) : options.name;
    return Transfer(m_client->Pool().Begin(TransferTask::Job, local, name, options));
}

Transfer Transfers::Put(std::string const& local, std::string const& server) const
{
    return Transfer(m_client->Pool().Begin(TransferTask::Put, local, server, {}));
}

Transfer Transfers::Get(std::string const& server, std::string const& local) const
{
    return Transfer(m_client->Pool().Begin(TransferTask::Get, server, local, {}));
}

std::vector<Transfer> Transfers::Running() const
{
    std::vector<Transfer> all;
    for (auto& task : m_client->Pool().Running())
        all.push_back(Transfer(std::move(task)));
    return all;
}
}  // namespace comgui
