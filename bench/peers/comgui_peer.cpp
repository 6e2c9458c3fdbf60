// The library itself: the stream, and the list that a client reads it into. The size of the last stream is
// the hint for the next one, as a sender of many tickets gives it.
#include "peer.h"

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
    default:
        break;  // the streams of these records hold nothing else
    }
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

    std::size_t Build(SETMULTIPAR* table) override
    {
        SETMULTIPAR_LIST list(false);
        for (SETMULTIPAR const* record = table; record->key; ++record)
            list.xSetParameter(record->key, record->type, record->value, record->pos);
        return list.Table(false) ? list.Size() : 0;
    }

    void Tell(std::string_view bytes, COMPARISON& comparison) override
    {
        SETMULTIPAR_LIST list(false);
        if (STICKET_BINSTREAM::Read(list, bytes.data(), bytes.size(), false) && list.Size() != 0)
            for (SETMULTIPAR const* record = list.Table(false); record->key; ++record)
                TellRecord(*record, comparison);
    }

private:
    std::string written;
};
}  // namespace

std::unique_ptr<PEER> MakeComgui() { return std::make_unique<COMGUI>(); }
std::unique_ptr<BUILDER> MakeComguiBuilder() { return std::make_unique<COMGUI>(); }
