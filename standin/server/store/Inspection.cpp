#include "standin/server/store/Inspection.h"

#include "standin/server/store/ChangeRecord.h"

namespace standin
{
namespace
{
constexpr std::size_t MostProblems = 100;

std::string NameOf(TicketAddress address)
{
    return "ticket " + std::to_string(address.type) + "/" + std::to_string(address.id);
}
}  // namespace

void Inspection::Advance(long long done)
{
    m_done += done;
    if (m_progress)
        m_progress(m_done, m_total);
}

void Inspection::Add(std::string problem)
{
    if (m_problems.size() < MostProblems)
        m_problems.push_back(std::move(problem));
}

void Inspection::LookAtTicket(TicketAddress address, TicketState const& state, Sequence last,
                              bool isOwnerKnown)
{
    if (!IsValid(address))
        Add(NameOf(address) + ": no ticket can have this address");
    if (state.incarnation < 1 || state.incarnation > state.revision || state.revision > last)
        Add(NameOf(address) + ": made by change " + std::to_string(state.incarnation) + " and changed by " +
            std::to_string(state.revision) + ", which cannot be");
    if (!isOwnerKnown)
        Add(NameOf(address) + ": belongs to a program that nobody knows");
}

void Inspection::LookAtParameter(TicketAddress address, int pos, int type,
                                 std::optional<StoredValue> const& value, bool isOfTicket)
{
    if (!value)
        Add(NameOf(address) + ": a value does not fit its type " + std::to_string(type));
    if (pos < 0)
        Add(NameOf(address) + ": a value at position " + std::to_string(pos));
    if (!isOfTicket)
        Add(NameOf(address) + ": has values but is no ticket");
}

void Inspection::LookAtRecord(Sequence found, Sequence& expected, int kind, TicketAddress address,
                              std::string_view record)
{
    if (found != expected)
        Add("journal: record " + std::to_string(found) + " where " + std::to_string(expected) + " is due");
    expected = found + 1;
    try
    {
        ReadChangeRecord(kind, address, record);
    }
    catch (StoreError const& error)
    {
        Add("journal: record " + std::to_string(found) + ": " + error.what());
    }
}
}  // namespace standin
