#include "desk/model/JobBoard.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace desk
{
namespace
{
constexpr std::string_view StateKey = "Job/State";
constexpr std::string_view ProgressKey = "Job/Progress";
constexpr std::string_view NameKey = "Job/Identification/Name";
constexpr std::string_view ToldKeys[] = {NameKey, ProgressKey, StateKey};  // the state knows best

comgui::TransferProgress Tamed(comgui::TransferProgress progress)
{
    progress.done = std::max(progress.done, 0LL);
    if (progress.total && *progress.total < progress.done)
        progress.total.reset();
    if (!std::isfinite(progress.rate) || progress.rate < 0)
        progress.rate = 0;
    if (progress.rest && progress.rest->count() < 0)
        progress.rest.reset();
    return progress;
}

std::optional<int> PercentOf(comgui::TransferProgress const& progress)
{
    if (!progress.total || *progress.total == 0)
        return std::nullopt;
    double const share = static_cast<double>(progress.done) / static_cast<double>(*progress.total);
    return static_cast<int>(share * 100);  // not rounded: 100 is the end
}

void Show(JobRow& row, comgui::TransferProgress const& progress)
{
    row.progress = Tamed(progress);
    row.percent = PercentOf(row.progress);
}

void Note(JobRow& row, double now)
{
    if (row.transfer)
        row.rates.Add(now, row.progress.rate);
    if (row.percent)
        row.percents.Add(now, *row.percent);
}

void Finish(JobRow& row, comgui::Outcome const& outcome)
{
    row.progress.rate = 0;
    row.progress.rest.reset();
    if (outcome)
    {
        row.state = JobState::Arrived;
        row.percent = 100;
        row.progress.done = row.progress.total.value_or(row.progress.done);
        return;
    }
    row.error = outcome.GetError();
    row.state = row.error.code == comgui::Cancelled ? JobState::Cancelled : JobState::Failed;
}

std::string LeafOf(std::string const& path) { return path.substr(path.find_last_of("/\\") + 1); }
}  // namespace

JobBoard::JobBoard(std::size_t limit) : m_limit(std::max<std::size_t>(limit, 1)) {}

JobBoard::Change JobBoard::Add(comgui::Transfer const& transfer, double now)
{
    int const number = transfer.Number();
    Change const change = Add(number, LeafOf(transfer.Source()));
    if (auto const outcome = transfer.WaitFor(std::chrono::milliseconds(0)))
        Take(comgui::TransferEnded{number, *outcome, transfer.Job()}, now);
    else if (auto const progress = transfer.Progress(); progress.done > 0)
        Take(comgui::TransferProgressed{number, progress}, now);
    return change;
}

JobBoard::Change JobBoard::Add(int transfer, std::string name)
{
    if (m_byTransfer.contains(transfer))
        return Change::None;
    JobRow row;
    row.transfer = transfer;
    row.name = std::move(name);
    Append(std::move(row));
    return Change::Rows;
}

JobBoard::Change JobBoard::Take(comgui::TransferProgressed const& event, double now)
{
    JobRow* const row = Find(m_byTransfer, event.transfer);
    if (!row || row->IsOver())
        return Change::None;
    row->state = JobState::Sending;
    Show(*row, event.progress);
    Note(*row, now);
    return Change::Row;
}

JobBoard::Change JobBoard::Take(comgui::TransferEnded const& event, double now)
{
    JobRow* const row = Find(m_byTransfer, event.transfer);
    if (!row || row->IsOver())
        return Change::None;
    Finish(*row, event.outcome);
    Note(*row, now);
    return event.job && row->state == JobState::Arrived &&
                   Identify(event.transfer, *event.job) == Change::Rows
               ? Change::Rows
               : Change::Row;
}

JobBoard::Change JobBoard::Identify(int transfer, int job)
{
    JobRow* row = Find(m_byTransfer, transfer);
    if (!row || row->job == job)
        return Change::None;
    Change change = Change::Row;
    if (JobRow const* const other = Find(m_byJob, job); other && !other->transfer)
    {
        Erase(*IndexOf(other->number));
        row = Find(m_byTransfer, transfer);
        change = Change::Rows;
    }
    if (row->job)
        m_byJob.erase(*row->job);
    row->job = job;
    m_byJob[job] = row->number;
    return change;
}

JobBoard::Change JobBoard::TakeJob(int job, comgui::Snapshot const& ticket, double now)
{
    JobRow* row = Find(m_byJob, job);
    bool const isNew = !row;
    if (isNew && (m_forgotten.contains(job) ||
                  std::ranges::none_of(ToldKeys, [&](auto key) { return ticket.Find(key) != nullptr; })))
        return Change::None;
    if (isNew)
    {
        JobRow fresh;
        fresh.job = job;
        row = &Append(std::move(fresh));
    }
    bool isChanged = false;
    for (std::string_view const key : ToldKeys)
        if (comgui::Value const* const value = ticket.Find(key))
            isChanged = Set(*row, key, *value, now) || isChanged;
    return isNew ? Change::Rows : isChanged ? Change::Row : Change::None;
}

JobBoard::Change JobBoard::TakeJob(int job, comgui::KeyChange const& change, double now)
{
    if (!change.value || !IsTold(change.key))
        return Change::None;
    JobRow* const row = Find(m_byJob, job);
    if (!row)
        return TakeJob(job, comgui::Snapshot({{change.key, *change.value}}), now);
    return Set(*row, change.key, *change.value, now) ? Change::Row : Change::None;
}

// Whether anything is different now. Of a transfer of this program only the name, which the server gives.
bool JobBoard::Set(JobRow& row, std::string_view key, comgui::Value const& value, double now)
{
    if (key == NameKey)
    {
        auto const* const name = std::get_if<std::string>(&value);
        return name && !name->empty() && std::exchange(row.name, *name) != *name;
    }
    auto const number = comgui::As<int>(value);
    if (row.transfer || value.IsList() || value.Type() == comgui::Value(std::string()).Type() || !number ||
        *number < 0)
        return false;
    JobState const state = row.state;
    auto const percent = row.percent;
    if (key == StateKey)
        row.state = *number > 0 ? JobState::Arrived : row.percent ? JobState::Sending : JobState::Waiting;
    else
        row.percent = std::min(*number, 100);
    if (row.state == JobState::Arrived)
        row.percent = 100;
    else if (row.percent)
        row.state = JobState::Sending;
    if (row.state == state && row.percent == percent)
        return false;
    Note(row, now);
    return true;
}

JobBoard::Change JobBoard::RemoveJob(int job)
{
    m_forgotten.erase(job);
    JobRow* const row = Find(m_byJob, job);
    if (!row)
        return Change::None;
    if (!row->transfer)
    {
        Erase(*IndexOf(row->number));
        return Change::Rows;
    }
    m_byJob.erase(job);
    row->job.reset();
    return Change::Row;
}

bool JobBoard::IsTold(std::string_view key) { return std::ranges::find(ToldKeys, key) != std::end(ToldKeys); }

std::vector<int> JobBoard::Jobs() const
{
    std::vector<int> jobs;
    for (JobRow const& row : m_rows)
        if (row.job)
            jobs.push_back(*row.job);
    return jobs;
}

JobBoard::Change JobBoard::RemoveOver()
{
    auto const gone = std::erase_if(m_rows,
                                    [this](JobRow const& row)
                                    {
                                        if (row.IsOver() && row.transfer)
                                            m_byTransfer.erase(*row.transfer);
                                        if (row.IsOver() && row.job)
                                        {
                                            m_byJob.erase(*row.job);
                                            m_forgotten.insert(*row.job);
                                        }
                                        return row.IsOver();
                                    });
    return gone > 0 ? Change::Rows : Change::None;
}

void JobBoard::Clear()
{
    m_rows.clear();
    m_byTransfer.clear();
    m_byJob.clear();
    m_forgotten.clear();
}

std::optional<std::size_t> JobBoard::IndexOf(RowNumber number) const
{
    auto const found = std::ranges::lower_bound(m_rows, number, {}, &JobRow::number);
    return found != m_rows.end() && found->number == number
               ? std::optional(static_cast<std::size_t>(found - m_rows.begin()))
               : std::nullopt;
}

JobRow const* JobBoard::Find(RowNumber number) const
{
    auto const index = IndexOf(number);
    return index ? &m_rows[*index] : nullptr;
}

JobRow* JobBoard::FindAny(RowNumber number)
{
    auto const index = IndexOf(number);
    return index ? &m_rows[*index] : nullptr;
}

JobRow* JobBoard::Find(Index const& index, int key)
{
    auto const found = index.find(key);
    return found == index.end() ? nullptr : FindAny(found->second);
}

JobRow& JobBoard::Append(JobRow row)
{
    if (m_rows.size() >= m_limit)
        MakeRoom();
    row.number = m_next++;
    if (row.transfer)
        m_byTransfer[*row.transfer] = row.number;
    if (row.job)
        m_byJob[*row.job] = row.number;
    return m_rows.emplace_back(std::move(row));
}

void JobBoard::MakeRoom()
{
    auto victim = std::ranges::find_if(m_rows, &JobRow::IsOver);
    if (victim == m_rows.end())
        victim = std::ranges::find_if(m_rows, [](JobRow const& row) { return !row.transfer; });
    if (victim != m_rows.end())
        Erase(static_cast<std::size_t>(victim - m_rows.begin()));
}

void JobBoard::Erase(std::size_t index)
{
    JobRow const& row = m_rows[index];
    if (row.transfer)
        m_byTransfer.erase(*row.transfer);
    if (row.job)
        m_byJob.erase(*row.job);
    m_rows.erase(m_rows.begin() + static_cast<std::ptrdiff_t>(index));
}
}  // namespace desk
