// Sends jobs and carries files, beside everything else that a program does. A handle: copies are the same.
// For any thread. Each transfer has a session of its own, under the same user and local end point, so that it
// can be cancelled alone; four run at a time, others wait for their turn.
#pragma once

#include "comgui/client/Result.h"
#include "comgui/client/TransferProgress.h"
#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace comgui
{
namespace detail
{
class Client;
class TransferTask;
}  // namespace detail

struct JobOptions
{
    std::string name{};           // that the server gives the file; empty: as on this side. UTF-8
    std::optional<int> queue{};   // id of a ticket of type 7
    std::optional<int> copies{};  // 1 and up
};

// One transfer. A handle: copies are the same, and the transfer goes on without any. For any thread.
class COMGUI_EXPORT Transfer
{
public:
    int Number() const;  // 1 and up; unique in the process
    std::string Source() const;
    std::string Target() const;  // a server path, a path on this side, or a job's name

    TransferProgress Progress() const;
    bool IsOver() const;

    // Ends it within a tenth of a second, unless the plug-in takes longer: nothing of it stays, neither here
    // nor at the server. If it has just arrived, it stays. Does not wait.
    void Cancel();

    // Waits for the end. Errors: Cancelled, NotLoggedIn, OutOfMemory, of a job NoSuchTicket (its queue) and
    // OutOfRange (its copies), the plug-in's.
    Outcome Wait() const;
    std::optional<Outcome> WaitFor(std::chrono::milliseconds time) const;  // nothing: not over yet

    std::optional<int> Job() const;  // the id of the job's ticket, as soon as it is known

private:
    friend class Transfers;
    explicit Transfer(std::shared_ptr<detail::TransferTask> task) : m_task(std::move(task)) {}

    std::shared_ptr<detail::TransferTask> m_task;
};

class COMGUI_EXPORT Transfers
{
public:
    // Each begins at once, or when it is its turn, and returns without waiting; what goes wrong is the
    // outcome. The end is also an event, TransferEnded. local: a path on this side. server:
    // "$(VARIABLE)/rest".
    Transfer SendJob(std::string const& local, JobOptions const& options = {}) const;
    Transfer Put(std::string const& local, std::string const& server) const;
    Transfer Get(std::string const& server, std::string const& local) const;

    std::vector<Transfer> Running() const;  // and waiting; the oldest first

private:
    friend class Connection;
    explicit Transfers(std::shared_ptr<detail::Client> client) : m_client(std::move(client)) {}

    std::shared_ptr<detail::Client> m_client;
};
}  // namespace comgui
