// One map from key to value, a vector as an array, like the msgpack peer. Used as it is fastest: written item
// by item into a buffer that is kept, with no tree in between; read into the library's tree.
#include "bench/peers/peer.h"

#include <cbor.h>
#include <cstdint>
#include <cstring>
#include <vector>

namespace
{
// A buffer that always has room for the next item.
class ENCODER
{
public:
    void Clear() { size = 0; }
    std::string_view Bytes() const { return {reinterpret_cast<char const*>(buffer.data()), size}; }

    template <typename Encode, typename T>
    void Put(Encode encode, T value)
    {
        constexpr std::size_t LargestHeader = 9;
        MakeRoom(LargestHeader);
        size += encode(value, buffer.data() + size, LargestHeader);
    }

    void PutInteger(long long value)
    {
        if (value >= 0)
            Put(cbor_encode_uint, static_cast<std::uint64_t>(value));
        else
            Put(cbor_encode_negint, static_cast<std::uint64_t>(-1 - value));
    }

    template <typename Encode>
    void PutBytes(Encode encodeStart, std::string_view bytes)
    {
        Put(encodeStart, bytes.size());
        MakeRoom(bytes.size());
        std::memcpy(buffer.data() + size, bytes.data(), bytes.size());
        size += bytes.size();
    }

private:
    void MakeRoom(std::size_t wanted)
    {
        if (buffer.size() - size < wanted)
            buffer.resize(buffer.size() * 2 + wanted);
    }

    std::vector<unsigned char> buffer;
    std::size_t size = 0;
};

void PutValue(ENCODER& encoder, SETMULTIPAR const& record)
{
    switch (record.type)
    {
    case PARAM_INT:
        encoder.PutInteger(ValueOf<int>(record));
        break;
    case PARAM_UNSIGNED:
        encoder.PutInteger(ValueOf<unsigned int>(record));
        break;
    case PARAM_INT64:
        encoder.PutInteger(ValueOf<long long>(record));
        break;
    case PARAM_DOUBLE:
        encoder.Put(cbor_encode_double, ValueOf<double>(record));
        break;
    case PARAM_STRING:
        encoder.PutBytes(cbor_encode_string_start, TextOf(record));
        break;
    case PARAM_BINSTRING:
        encoder.PutBytes(cbor_encode_bytestring_start, BytesOf(record));
        break;
    default:
        break;
    }
}

// The root of a tree that was read.
class TREE
{
public:
    explicit TREE(std::string_view bytes)
    {
        cbor_load_result result;
        root = cbor_load(reinterpret_cast<unsigned char const*>(bytes.data()), bytes.size(), &result);
    }
    TREE(TREE const&) = delete;
    TREE& operator=(TREE const&) = delete;
    ~TREE()
    {
        if (root)
            cbor_decref(&root);
    }

    std::size_t Size() const { return root ? cbor_map_size(root) : 0; }
    cbor_pair const& operator[](std::size_t i) const { return cbor_map_handle(root)[i]; }

private:
    cbor_item_t* root;
};

std::string_view TextOf(cbor_item_t const* item)
{
    return {reinterpret_cast<char const*>(cbor_string_handle(item)), cbor_string_length(item)};
}

void TellValue(std::string_view key, int pos, cbor_item_t const* item, COMPARISON& comparison)
{
    switch (cbor_typeof(item))
    {
    case CBOR_TYPE_UINT:
        return comparison.Number(key, pos, static_cast<long double>(cbor_get_int(item)));
    case CBOR_TYPE_NEGINT:
        return comparison.Number(key, pos, -1 - static_cast<long double>(cbor_get_int(item)));
    case CBOR_TYPE_FLOAT_CTRL:
        return comparison.Number(key, pos, cbor_float_get_float(item));
    case CBOR_TYPE_STRING:
        return comparison.Text(key, pos, TextOf(item));
    case CBOR_TYPE_BYTESTRING:
        return comparison.Bytes(
            key, pos,
            {reinterpret_cast<char const*>(cbor_bytestring_handle(item)), cbor_bytestring_length(item)});
    default:
        break;
    }
}

class CBOR : public PEER
{
public:
    std::string_view Write(SETMULTIPAR* table) override
    {
        encoder.Clear();
        FindEnds(table, ends);
        encoder.Put(cbor_encode_map_start, ends.size());
        SETMULTIPAR const* record = table;
        for (SETMULTIPAR const* const end : ends)
        {
            encoder.PutBytes(cbor_encode_string_start, record->key);
            if (IsVector(*record))
                encoder.Put(cbor_encode_array_start, static_cast<std::size_t>(end - record));
            for (; record != end; ++record)
                PutValue(encoder, *record);
        }
        return encoder.Bytes();
    }

    std::size_t Read(std::string_view bytes) override { return TREE(bytes).Size(); }

    void Tell(std::string_view bytes, COMPARISON& comparison) override
    {
        TREE const tree(bytes);
        for (std::size_t i = 0; i < tree.Size(); ++i)
            Tell(TextOf(tree[i].key), tree[i].value, comparison);
    }

private:
    static void Tell(std::string_view key, cbor_item_t const* value, COMPARISON& comparison)
    {
        if (cbor_typeof(value) != CBOR_TYPE_ARRAY)
            return TellValue(key, -1, value, comparison);
        for (std::size_t i = 0; i < cbor_array_size(value); ++i)
            TellValue(key, static_cast<int>(i), cbor_array_handle(value)[i], comparison);
    }

    ENCODER encoder;
    std::vector<SETMULTIPAR const*> ends;
};
}  // namespace

std::unique_ptr<PEER> MakeCbor() { return std::make_unique<CBOR>(); }
