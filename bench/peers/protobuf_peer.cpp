// A keyed, repeated message, used as it is fastest in each case. A writer fills one message again and again,
// which keeps its memory, and writes to a string that is kept as well. A message that is read or built, and
// destroyed after its use, lives in an arena whose one block is kept and is large enough from the second time
// on; the heap variants show the same with a message that is a plain local variable.
#include "bench/peers/peer.h"

#include "ticket.pb.h"

#include <google/protobuf/arena.h>
#include <string>
#include <vector>

namespace
{
using google::protobuf::Arena;
using google::protobuf::ArenaOptions;

// The memory of one message at a time.
class BLOCK
{
public:
    // Calls use(arena) and destroys the arena; gives what use gave.
    template <typename Use>
    std::size_t With(Use use)
    {
        ArenaOptions options;
        options.initial_block = memory.data();
        options.initial_block_size = memory.size();
        std::size_t used = 0;
        std::size_t result = 0;
        {
            Arena arena(options);
            result = use(arena);
            used = arena.SpaceAllocated();
        }
        if (used > memory.size())
            memory.resize(2 * used);  // for the next one like this
        return result;
    }

private:
    std::vector<char> memory;
};

void SetValue(peers::Parameter& parameter, SETMULTIPAR const& record)
{
    switch (record.type)
    {
    case PARAM_INT:
        parameter.set_integer(ValueOf<int>(record));
        break;
    case PARAM_UNSIGNED:
        parameter.set_unsigned_integer(ValueOf<unsigned int>(record));
        break;
    case PARAM_INT64:
        parameter.set_integer64(ValueOf<long long>(record));
        break;
    case PARAM_DOUBLE:
        parameter.set_number(ValueOf<double>(record));
        break;
    case PARAM_STRING:
        parameter.set_text(static_cast<char const*>(record.value));
        break;
    case PARAM_BINSTRING:
        parameter.set_data(ValueOf<BIN_STRING>(record).data, ValueOf<BIN_STRING>(record).size);
        break;
    default:
        break;
    }
}

template <typename T, typename Values>
void SetValues(Values& values, SETMULTIPAR const* first, SETMULTIPAR const* end)
{
    values.Reserve(static_cast<int>(end - first));
    for (; first != end; ++first)
        values.AddAlreadyReserved(ValueOf<T>(*first));
}

void Fill(peers::Ticket& ticket, SETMULTIPAR const* record, bool packed)
{
    while (record->key)
    {
        peers::Parameter& parameter = *ticket.add_parameters();
        parameter.set_key(record->key);
        if (!IsVector(*record) || !packed)
        {
            if (IsVector(*record))
                parameter.set_pos(record->pos);
            SetValue(parameter, *record++);
            continue;
        }
        SETMULTIPAR const* const end = EndOfKey(record);
        if (record->type == PARAM_DOUBLE)
            SetValues<double>(*parameter.mutable_doubles()->mutable_values(), record, end);
        else
            SetValues<int>(*parameter.mutable_ints()->mutable_values(), record, end);
        record = end;
    }
}

template <typename Values>
void TellVector(std::string_view key, Values const& values, COMPARISON& comparison)
{
    int pos = 0;
    for (auto const value : values)
        comparison.Number(key, pos++, value);
}

void TellParameter(peers::Parameter const& parameter, COMPARISON& comparison)
{
    std::string_view const key = parameter.key();
    int const pos = parameter.pos();
    switch (parameter.value_case())
    {
    case peers::Parameter::kInteger:
        return comparison.Number(key, pos, parameter.integer());
    case peers::Parameter::kUnsignedInteger:
        return comparison.Number(key, pos, parameter.unsigned_integer());
    case peers::Parameter::kInteger64:
        return comparison.Number(key, pos, static_cast<long double>(parameter.integer64()));
    case peers::Parameter::kNumber:
        return comparison.Number(key, pos, parameter.number());
    case peers::Parameter::kText:
        return comparison.Text(key, pos, parameter.text());
    case peers::Parameter::kData:
        return comparison.Bytes(key, pos, parameter.data());
    case peers::Parameter::kInts:
        return TellVector(key, parameter.ints().values(), comparison);
    case peers::Parameter::kDoubles:
        return TellVector(key, parameter.doubles().values(), comparison);
    case peers::Parameter::VALUE_NOT_SET:
        break;
    }
}

void TellTicket(peers::Ticket const& ticket, COMPARISON& comparison)
{
    for (peers::Parameter const& parameter : ticket.parameters())
        TellParameter(parameter, comparison);
}

class PROTOBUF : public PEER, public BUILDER
{
public:
    PROTOBUF(bool packVectors, bool useArena) : packed(packVectors), inArena(useArena) {}

    std::string_view Write(SETMULTIPAR* table) override
    {
        toWrite.Clear();
        Fill(toWrite, table, packed);
        toWrite.SerializeToString(&written);
        return written;
    }

    std::size_t Read(std::string_view bytes) override
    {
        return WithTicket([&](peers::Ticket& ticket) { return Parse(ticket, bytes); });
    }

    std::shared_ptr<void> Keep(std::string_view bytes) override
    {
        if (!inArena)
        {
            auto ticket = std::make_shared<peers::Ticket>();
            return Parse(*ticket, bytes) ? ticket : nullptr;
        }
        auto arena = std::make_shared<Arena>();
        return Parse(*Arena::CreateMessage<peers::Ticket>(arena.get()), bytes) ? arena : nullptr;
    }

    std::size_t Build(SETMULTIPAR const* table) override
    {
        return WithTicket(
            [&](peers::Ticket& ticket)
            {
                Fill(ticket, table, packed);
                return static_cast<std::size_t>(ticket.parameters_size());
            });
    }

    void Tell(std::string_view bytes, COMPARISON& comparison) override
    {
        peers::Ticket ticket;
        Parse(ticket, bytes);
        TellTicket(ticket, comparison);
    }

    void TellBuilt(SETMULTIPAR const* table, COMPARISON& comparison) override
    {
        peers::Ticket ticket;
        Fill(ticket, table, packed);
        TellTicket(ticket, comparison);
    }

private:
    template <typename Use>
    std::size_t WithTicket(Use use)
    {
        if (!inArena)
        {
            peers::Ticket ticket;
            return use(ticket);
        }
        return block.With([&](Arena& arena) { return use(*Arena::CreateMessage<peers::Ticket>(&arena)); });
    }

    static std::size_t Parse(peers::Ticket& ticket, std::string_view bytes)
    {
        return ticket.ParseFromArray(bytes.data(), static_cast<int>(bytes.size()))
                   ? static_cast<std::size_t>(ticket.parameters_size())
                   : 0;
    }

    bool packed;
    bool inArena;
    BLOCK block;
    peers::Ticket toWrite;
    std::string written;
};
}  // namespace

std::unique_ptr<PEER> MakeProtobuf() { return std::make_unique<PROTOBUF>(true, true); }
std::unique_ptr<PEER> MakeProtobufEach() { return std::make_unique<PROTOBUF>(false, true); }
std::unique_ptr<PEER> MakeProtobufHeap() { return std::make_unique<PROTOBUF>(true, false); }
std::unique_ptr<PEER> MakeProtobufEachHeap() { return std::make_unique<PROTOBUF>(false, false); }
std::unique_ptr<BUILDER> MakeProtobufBuilder() { return std::make_unique<PROTOBUF>(true, true); }
std::unique_ptr<BUILDER> MakeProtobufHeapBuilder() { return std::make_unique<PROTOBUF>(true, false); }
