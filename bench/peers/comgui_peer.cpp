// The library itself: the stream, and the list that a client reads it into. The size of the last stream is
// the hint for the next one, as a sender of many tickets gives it.
#include "bench/peers/peer.h"

#include <string>

namespace
{
void TellRecord(SETMULTIPAR const& record, COMPARISON& comparison)
{
    switch (record.type)
    {
    case PARAM_INT:
        return comparison.Number(record.key, record.pos, ValueOf<int>(record));
    case PARAM_DOUBLE:
        return comparison.Number(record.key, record.pos, ValueOf<double>(record));
    case PARAM_STRING:
        return comparison.Text(record.key, record.pos, TextOf(record));
    case PARAM_BINSTRING:
        return comparison.Bytes(record.key, record.pos, BytesOf(record));
    case PARAM_UNSIGNED:
        return comparison.Number(record.key, record.pos, ValueOf<unsigned int>(record));
    case PARAM_INT64:
        return comparison.Number(record.key, record.pos,
                                 static_cast<long double>(ValueOf<long long>(record)));
    default:
        break;  // none of the workloads holds anything else
    }
}

void TellList(SETMULTIPAR_LIST& list, COMPARISON& comparison)
{
    if (list.Size() != 0)
        for (SETMULTIPAR const* record = list.Table(false); record->key; ++record)
            TellRecord(*record, comparison);
}

void Fill(SETMULTIPAR_LIST& list, SETMULTIPAR const* record)
{
    for (; record->key; ++record)
        list.xSetParameter(record->key, record->type, record->value, record->pos);
}

class COMGUI : public PEER, public BUILDER
{
public:
    std::string_view Write(SETMULTIPAR* table) override
    {
        STICKET_BINSTREAM::Write(written, table, written.size());
        return written;
    }

    std::size_t Read(std::string_view bytes) override
    {
        SETMULTIPAR_LIST list(false);
        return STICKET_BINSTREAM::Read(list, bytes.data(), bytes.size(), false) ? list.Size() : 0;
    }

    std::shared_ptr<void> Keep(std::string_view bytes) override
    {
        auto list = std::make_shared<SETMULTIPAR_LIST>(false);
        return STICKET_BINSTREAM::Read(*list, bytes.data(), bytes.size(), false) ? list : nullptr;
    }

    std::size_t Build(SETMULTIPAR const* table) override
    {
        SETMULTIPAR_LIST list(false);
        Fill(list, table);
        return list.Table(false) ? list.Size() : 0;
    }

    void TellBuilt(SETMULTIPAR const* table, COMPARISON& comparison) override
    {
        SETMULTIPAR_LIST list(false);
        Fill(list, table);
        TellList(list, comparison);
    }

    void Tell(std::string_view bytes, COMPARISON& comparison) override
    {
        SETMULTIPAR_LIST list(false);
        if (STICKET_BINSTREAM::Read(list, bytes.data(), bytes.size(), false))
            TellList(list, comparison);
    }

private:
    std::string written;
};
}  // namespace

std::unique_ptr<PEER> MakeComgui() { return std::make_unique<COMGUI>(); }
std::unique_ptr<BUILDER> MakeComguiBuilder() { return std::make_unique<COMGUI>(); }
