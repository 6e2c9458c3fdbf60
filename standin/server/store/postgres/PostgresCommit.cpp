// How a PostgresStore commits changes.
#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/StoreRows.h"
#include "standin/server/store/postgres/PostgresTurn.h"
#include "standin/server/store/postgres/Schema.h"
#include <algorithm>
#include <climits>

namespace standin
{
using postgres::BrokenConnection;
using postgres::Clock;
using postgres::Parameters;
using postgres::Result;

namespace
{
// What the parameters of a change come to, so that the database does it in no more than three statements:
// each key that goes and each value that goes or comes, once.
class Effect
{
public:
    explicit Effect(TicketChange const& change)
    {
        for (ParameterChange const& parameter : change.parameters)
            Add(parameter);
    }

    void AddTo(Parameters& parameters) const
    {
        std::vector<std::string_view> const droppedKeys(m_droppedKeys.begin(), m_droppedKeys.end());
        std::vector<std::string_view> droppedValueKeys, keys, texts;
        std::vector<int> droppedPositions, positions, types;
        std::vector<long long> numbers;
        for (auto const& [place, parameter] : m_values)
        {
            (parameter ? keys : droppedValueKeys).push_back(place.first);
            (parameter ? positions : droppedPositions).push_back(place.second);
            if (!parameter)
                continue;
            TicketValue const& value = parameter->value;
            types.push_back(static_cast<int>(value.type));
            numbers.push_back(IsText(value.type) ? 0 : ColumnOf(value));
            texts.push_back(!IsText(value.type) ? std::string_view()
                            : value.text        ? std::string_view(value.text->bytes)
                                                : std::string_view(""));
        }
        parameters << droppedKeys << droppedValueKeys << droppedPositions << keys << positions << types
                   << numbers << texts;
    }

private:
    void Add(ParameterChange const& parameter)
    {
        std::string_view const key = parameter.key;
        bool const isDeletion = IsDeletion(parameter);
        if (parameter.pos == -1 && (isDeletion || parameter.hadOthers))
        {
            m_values.erase(m_values.lower_bound({key, INT_MIN}), m_values.upper_bound({key, INT_MAX}));
            m_droppedKeys.insert(key);
        }
        if (!isDeletion)
            m_values[{key, std::max(parameter.pos, 0)}] = &parameter;
        else if (m_droppedKeys.contains(key))
            m_values.erase({key, parameter.pos});
        else
            m_values[{key, parameter.pos}] = nullptr;
    }

    std::set<std::string_view> m_droppedKeys;
    std::map<std::pair<std::string_view, int>, ParameterChange const*> m_values;  // null: goes
};

// The tickets that it was planned on, in the order in which they are locked, and which of them, counted from
// 1, is the ticket itself; 0 for a creation.
void AddPlan(Parameters& parameters, TicketChange const& change)
{
    std::vector<TicketChange::Basis> bases = change.others;
    if (change.kind != TicketChange::Create)
        bases.insert(bases.begin(), {change.address, change.incarnation, change.revision});
    std::stable_sort(bases.begin(), bases.end(),
                     [](auto const& left, auto const& right) { return left.address < right.address; });
    std::vector<int> types, ids;
    std::vector<long long> incarnations, revisions;
    int target = 0;
    for (TicketChange::Basis const& basis : bases)
    {
        types.push_back(basis.address.type);
        ids.push_back(basis.address.id);
        incarnations.push_back(static_cast<long long>(basis.incarnation));
        revisions.push_back(static_cast<long long>(basis.revision));
        if (target == 0 && change.kind != TicketChange::Create && basis.address == change.address)
            target = static_cast<int>(types.size());
    }
    parameters << types << ids << incarnations << revisions << target;
}

CommitOutcome::Kind KindOf(int answer)
{
    switch (static_cast<postgres::CommitAnswer>(answer))
    {
    case postgres::CommitAnswer::Committed:
        return CommitOutcome::Committed;
    case postgres::CommitAnswer::NoFreeId:
        return CommitOutcome::NoFreeId;
    default:
        return CommitOutcome::Conflict;
    }
}
}  // namespace

CommitOutcome PostgresStore::Commit(TicketChange const& change, std::uint64_t number)
{
    CheckUsable();
    Parameters const request = RequestOf(change, m_self, number);
    Turn turn(*this);
    Sequence const known = m_committed;  // less than what this change gets
    try
    {
        CommitOutcome const outcome = Send(turn, request, change.address);
        if (outcome.kind == CommitOutcome::Committed)
            Announce(outcome.sequence);
        return outcome;
    }
    catch (BrokenConnection const&)
    {
        std::lock_guard const lock(m_unknowns);
        m_unknown[number] = {known, Clock::now(), true};
        return {};
    }
}

// Throws StoreError for what cannot be stored. Texts are those of the change.
Parameters PostgresStore::RequestOf(TicketChange const& change, ProgramId program, std::uint64_t number) const
{
    std::string record;
    try
    {
        CheckAddress(change);
        AppendChangeRecord(record, change);
    }
    catch (StoreError const& error)
    {
        throw StoreError(m_name + ": " + error.what());
    }
    Parameters parameters;
    parameters << static_cast<int>(change.kind) << change.address << change.aboveId
               << m_options.limits.largestId;
    if (change.owner == TicketChange::Owner::Unchanged)
        parameters.Null();
    else
        parameters << (change.owner == TicketChange::Owner::ThisProgram ? program : ProgramId{0});
    (parameters << program << number).Keep(std::move(record));
    AddPlan(parameters, change);
    Effect(change).AddTo(parameters);
    return parameters;
}

// The whole change in one round trip.
CommitOutcome PostgresStore::Send(Turn& turn, Parameters const& request, TicketAddress address)
{
    Result const row =
        turn.Run("SELECT answer, last, of_id FROM commit_change($1, $2, $3, $4, $5, $6, $7, $8, $9, $10, "
                 "$11, $12, $13, $14, $15, $16, $17, $18, $19, $20, $21, $22)",
                 request);
    return {KindOf(row.Int(0, 0)), row.Number(0, 1), {address.type, row.Int(0, 2)}};
}

// To this program at once and to the others soon, for who has the turn.
void PostgresStore::Announce(Sequence committed)
{
    RaiseCommitted(committed);
    m_bell->Ring(committed);
}

// What is found may be on this server alone: when a break ends the wait for a standby, the server lets
// everybody see the change. A commit behind it waits for the same standbys, so that the answer is worth as
// much as that of the change itself would have been.
void PostgresStore::MakeLasting(postgres::Connection& connection, Clock::time_point deadline)
{
    connection.Run("SELECT pg_logical_emit_message(true, 'comgui', '')", {}, deadline);
}

std::optional<CommitOutcome> PostgresStore::FindCommit(std::uint64_t number)
{
    NoteQuestion(number);
    Turn turn(*this);
    Result const rows =
        turn.Run("SELECT s.forgotten, c.sequence, c.type, c.id FROM site s LEFT JOIN ("
                 "SELECT sequence, type, id FROM journal WHERE program = $1 AND number = $2 UNION ALL "
                 "SELECT sequence, type, id FROM outcome WHERE program = $1 AND number = $2) c ON true",
                 Parameters() << m_self << number);
    bool const isMade = !rows.IsNull(0, 1);
    if (isMade)
        MakeLasting(turn.Connection(), turn.Deadline());
    NoteAnswer(number, isMade, rows.Number(0, 0));
    if (!isMade)
        return std::nullopt;
    Announce(rows.Number(0, 1));  // nobody has rung for it
    return CommitOutcome{CommitOutcome::Committed, rows.Number(0, 1), {rows.Int(0, 2), rows.Int(0, 3)}};
}

void PostgresStore::NoteQuestion(std::uint64_t number)
{
    std::lock_guard const lock(m_unknowns);
    auto const unknown = m_unknown.find(number);
    if (unknown != m_unknown.end())
        unknown->second.askedAt = Clock::now();
}

// forgotten: the newest change that the site knows nothing of any more. Throws StoreError if a change that is
// not found may be one of those.
void PostgresStore::NoteAnswer(std::uint64_t number, bool isMade, Sequence forgotten)
{
    std::lock_guard const lock(m_unknowns);
    auto const unknown = m_unknown.find(number);
    bool const isNoted = unknown != m_unknown.end();
    if (!isMade && isNoted && unknown->second.known < forgotten)
        unknown->second.isKept = false;
    if (!isMade && (isNoted ? !unknown->second.isKept : forgotten > 0))
        throw StoreError(m_name +
                         ": nobody knows any more whether a change was made, since nobody has asked for "
                         "long; look at what the ticket holds");
    if (isNoted)
        m_unknown.erase(unknown);
}

// The server answers a commit when it is as lasting as the server's synchronous_commit makes it: by default
// on the disk, and on those of synchronous standbys. There is nothing left to wait for.
void PostgresStore::Sync() { CheckUsable(); }
}  // namespace standin
