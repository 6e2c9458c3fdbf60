// One map from key to value, a vector as an array; the type of a value is what msgpack itself distinguishes
// (integer, double, text, bytes). Used as it is fastest: the buffers are kept from one Write to the next, and
// what was read refers to the bytes instead of copying texts out of them.
//
// A stream of the library is a std::string, so the peer that it is measured beside writes one, too. Writing
// into msgpack's own buffer, whose calls the compiler inlines, is a peer of its own.
#include "bench/peers/peer.h"

#include <cstdint>
#include <msgpack.hpp>
#include <string>
#include <vector>

namespace
{
struct STRING_BUFFER
{
    void write(char const* bytes, std::size_t size) { text.append(bytes, size); }
    void clear() { text.clear(); }
    char const* data() const { return text.data(); }
    std::size_t size() const { return text.size(); }

    std::string text;
};

template <typename Buffer>
void PackText(msgpack::packer<Buffer>& packer, std::string_view text)
{
    packer.pack_str(static_cast<std::uint32_t>(text.size()));
    packer.pack_str_body(text.data(), static_cast<std::uint32_t>(text.size()));
}

template <typename Buffer>
void PackBytes(msgpack::packer<Buffer>& packer, std::string_view bytes)
{
    packer.pack_bin(static_cast<std::uint32_t>(bytes.size()));
    packer.pack_bin_body(bytes.data(), static_cast<std::uint32_t>(bytes.size()));
}

template <typename Buffer>
void PackValue(msgpack::packer<Buffer>& packer, SETMULTIPAR const& record)
{
    switch (record.type)
    {
    case PARAM_INT:
        packer.pack_int(ValueOf<int>(record));
        break;
    case PARAM_UNSIGNED:
        packer.pack_unsigned_int(ValueOf<unsigned int>(record));
        break;
    case PARAM_INT64:
        packer.pack_long_long(ValueOf<long long>(record));
        break;
    case PARAM_DOUBLE:
        packer.pack_double(ValueOf<double>(record));
        break;
    case PARAM_STRING:
        PackText(packer, TextOf(record));
        break;
    case PARAM_BINSTRING:
        PackBytes(packer, BytesOf(record));
        break;
    default:
        packer.pack_nil();
        break;
    }
}

void TellValue(std::string_view key, int pos, msgpack::object const& value, COMPARISON& comparison)
{
    switch (value.type)
    {
    case msgpack::type::POSITIVE_INTEGER:
        return comparison.Number(key, pos, static_cast<long double>(value.via.u64));
    case msgpack::type::NEGATIVE_INTEGER:
        return comparison.Number(key, pos, static_cast<long double>(value.via.i64));
    case msgpack::type::FLOAT32:
    case msgpack::type::FLOAT64:
        return comparison.Number(key, pos, value.via.f64);
    case msgpack::type::STR:
        return comparison.Text(key, pos, {value.via.str.ptr, value.via.str.size});
    case msgpack::type::BIN:
        return comparison.Bytes(key, pos, {value.via.bin.ptr, value.via.bin.size});
    default:
        break;
    }
}

template <typename Buffer>
class MSGPACK : public PEER
{
public:
    std::string_view Write(SETMULTIPAR* table) override
    {
        written.clear();
        msgpack::packer<Buffer> packer(written);
        FindEnds(table, ends);
        packer.pack_map(static_cast<std::uint32_t>(ends.size()));
        SETMULTIPAR const* record = table;
        for (SETMULTIPAR const* const end : ends)
        {
            PackText(packer, record->key);
            if (IsVector(*record))
                packer.pack_array(static_cast<std::uint32_t>(end - record));
            for (; record != end; ++record)
                PackValue(packer, *record);
        }
        return {written.data(), written.size()};
    }

    std::size_t Read(std::string_view bytes) override
    {
        msgpack::zone zone;
        return Unpack(zone, bytes).via.map.size;
    }

    std::shared_ptr<void> Keep(std::string_view bytes) override
    {
        auto zone = std::make_shared<msgpack::zone>();
        return Unpack(*zone, bytes).via.map.size != 0 ? zone : nullptr;
    }

    bool KeepsBytes() const override { return true; }

    void Tell(std::string_view bytes, COMPARISON& comparison) override
    {
        msgpack::zone zone;
        msgpack::object_map const entries = Unpack(zone, bytes).via.map;
        for (std::uint32_t i = 0; i < entries.size; ++i)
            Tell(entries.ptr[i], comparison);
    }

private:
    // A map, or the exception of the library: none of its bytes come from elsewhere.
    static msgpack::object Unpack(msgpack::zone& zone, std::string_view bytes)
    {
        bool referenced = false;
        return msgpack::unpack(zone, bytes.data(), bytes.size(), referenced,
                               [](msgpack::type::object_type, std::size_t, void*) { return true; });
    }

    static void Tell(msgpack::object_kv const& entry, COMPARISON& comparison)
    {
        std::string_view const key(entry.key.via.str.ptr, entry.key.via.str.size);
        if (entry.val.type != msgpack::type::ARRAY)
            return TellValue(key, -1, entry.val, comparison);
        msgpack::object_array const& values = entry.val.via.array;
        for (std::uint32_t i = 0; i < values.size; ++i)
            TellValue(key, static_cast<int>(i), values.ptr[i], comparison);
    }

    Buffer written;
    std::vector<SETMULTIPAR const*> ends;
};
}  // namespace

std::unique_ptr<PEER> MakeMsgpack() { return std::make_unique<MSGPACK<STRING_BUFFER>>(); }
std::unique_ptr<PEER> MakeMsgpackBuffer() { return std::make_unique<MSGPACK<msgpack::sbuffer>>(); }
