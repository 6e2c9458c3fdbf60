#include "standin/server/store/StoreRows.h"

#include "standin/server/store/Store.h"
#include <bit>
#include <cerrno>
#include <cstdlib>
#include <unistd.h>
#include <utility>

namespace standin
{
void CheckAddress(TicketChange const& change)
{
    TicketAddress const address = change.address;
    bool const isNext = change.kind == TicketChange::Create && address.id == TicketChange::NextId;
    if (!IsValid({address.type, isNext ? 0 : address.id}))
        throw StoreError("no ticket can have the address " + std::to_string(address.type) + "/" +
                         std::to_string(address.id) + "; choose another");
}

long long ColumnOf(TicketValue const& value)
{
    if (value.type == PARAM_INT)
        return static_cast<int>(value.word);
    if (value.type == PARAM_UNSIGNED)
        return static_cast<unsigned>(value.word);
    return static_cast<long long>(value.word);
}

std::optional<StoredValue> FittingValue(int type, std::optional<long long> number,
                                        std::optional<std::string_view> bytes)
{
    StoredValue value;
    value.type = static_cast<PARAM_TYPE>(type);
    switch (value.type)
    {
    case PARAM_STRING:
    case PARAM_BINSTRING:
        if (!bytes)
            return std::nullopt;
        value.bytes = *bytes;
        return value;
    case PARAM_INT:
    case PARAM_INT64:
    case PARAM_UNSIGNED:
    case PARAM_UNSIGNED64:
    case PARAM_DOUBLE:
        if (!number)
            return std::nullopt;
        if (value.type == PARAM_DOUBLE)
            value.number = std::bit_cast<double>(*number);
        else
            value.integer = *number;
        return value;
    default:
        return std::nullopt;
    }
}

void TicketAssembly::Begin(TicketAddress address)
{
    if (m_ticket && m_ticket->address == address)
        return;
    End();
    m_ticket.emplace();
    m_ticket->kind = TicketChange::Create;
    m_ticket->address = address;
}

void TicketAssembly::Add(std::string_view key, int pos, StoredValue const& value)
{
    m_ticket->parameters.push_back({std::string(key), pos, TicketValue::FromStored(value), false});
}

void TicketAssembly::End()
{
    if (m_ticket)
        m_take(*std::exchange(m_ticket, std::nullopt));
}

std::string ProgramName()
{
#if defined(__GLIBC__)
    return program_invocation_short_name;
#else
    return getprogname();
#endif
}

std::string MachineName()
{
    char name[256] = {};
    return gethostname(name, sizeof name - 1) == 0 && name[0] != '\0' ? name : "localhost";
}
}  // namespace standin
