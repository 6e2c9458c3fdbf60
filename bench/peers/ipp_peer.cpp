// Attributes of an IPP message, as printers and their clients exchange them; a vector is an attribute with as
// many values. IPP has integers of 32 bits and no doubles: a double or a larger integer is an octet string of
// 8 bytes, which the client knows how to take. Texts are handed over as constants, which are not copied.
#include "bench/peers/peer.h"

#include <algorithm>
#include <climits>
#include <cstring>
#include <cups/ipp.h>
#include <string>
#include <sys/types.h>
#include <utility>

namespace
{
struct IPP_DELETER
{
    void operator()(ipp_t* message) const { ippDelete(message); }
};
using IPP = std::unique_ptr<ipp_t, IPP_DELETER>;

constexpr ipp_tag_t Group = IPP_TAG_JOB;

void AddInteger(ipp_t* message, char const* key, long long value)
{
    if (value >= INT_MIN && value <= INT_MAX)
        ippAddInteger(message, Group, IPP_TAG_INTEGER, key, static_cast<int>(value));
    else
        ippAddOctetString(message, Group, key, &value, sizeof value);
}

void AddSingle(ipp_t* message, SETMULTIPAR const& record)
{
    switch (record.type)
    {
    case PARAM_INT:
        AddInteger(message, record.key, ValueOf<int>(record));
        break;
    case PARAM_UNSIGNED:
        AddInteger(message, record.key, ValueOf<unsigned int>(record));
        break;
    case PARAM_INT64:
        AddInteger(message, record.key, ValueOf<long long>(record));
        break;
    case PARAM_DOUBLE:
        ippAddOctetString(message, Group, record.key, record.value, sizeof(double));
        break;
    case PARAM_STRING:
        ippAddString(message, Group, IPP_CONST_TAG(IPP_TAG_TEXT), record.key, nullptr,
                     static_cast<char const*>(record.value));
        break;
    case PARAM_BINSTRING:
        ippAddOctetString(message, Group, record.key, ValueOf<BIN_STRING>(record).data,
                          static_cast<int>(ValueOf<BIN_STRING>(record).size));
        break;
    default:
        break;
    }
}

void AddIntegers(ipp_t* message, SETMULTIPAR const* first, SETMULTIPAR const* end)
{
    int const size = static_cast<int>(end - first);
    ipp_attribute_t* const attribute =
        ippAddIntegers(message, Group, IPP_TAG_INTEGER, first->key, size, nullptr);
    for (int i = 0; i < size; ++i)
        ippSetInteger(message, const_cast<ipp_attribute_t**>(&attribute), i, ValueOf<int>(first[i]));
}

void AddDoubles(ipp_t* message, SETMULTIPAR const* first, SETMULTIPAR const* end)
{
    ipp_attribute_t* attribute = ippAddOctetString(message, Group, first->key, first->value, sizeof(double));
    for (int i = 1; first + i != end; ++i)
        ippSetOctetString(message, &attribute, i, first[i].value, sizeof(double));
}

IPP Message(SETMULTIPAR const* record)
{
    IPP message(ippNew());
    while (record->key)
    {
        SETMULTIPAR const* const end = EndOfKey(record);
        if (!IsVector(*record))
            AddSingle(message.get(), *record);
        else if (record->type == PARAM_DOUBLE)
            AddDoubles(message.get(), record, end);
        else
            AddIntegers(message.get(), record, end);
        record = end;
    }
    return message;
}

ssize_t Append(void* written, ipp_uchar_t* buffer, std::size_t size)
{
    static_cast<std::string*>(written)->append(reinterpret_cast<char const*>(buffer), size);
    return static_cast<ssize_t>(size);
}

ssize_t Take(void* left, ipp_uchar_t* buffer, std::size_t size)
{
    auto& bytes = *static_cast<std::string_view*>(left);
    size = std::min(size, bytes.size());
    std::memcpy(buffer, bytes.data(), size);
    bytes.remove_prefix(size);
    return static_cast<ssize_t>(size);
}

IPP Parsed(std::string_view bytes)
{
    IPP message(ippNew());
    ipp_state_t state = IPP_STATE_IDLE;
    while (state != IPP_STATE_DATA && state != IPP_STATE_ERROR)
        state = ippReadIO(&bytes, Take, 1, nullptr, message.get());
    return state == IPP_STATE_DATA ? std::move(message) : nullptr;
}

template <typename T>
T FromOctets(void const* data)
{
    T value;
    std::memcpy(&value, data, sizeof value);
    return value;
}

void TellOctets(std::string_view key, int pos, void const* data, int size, COMPARISON& comparison)
{
    switch (comparison.Expected().type)
    {
    case PARAM_DOUBLE:
        return comparison.Number(key, pos, FromOctets<double>(data));
    case PARAM_BINSTRING:
        return comparison.Bytes(key, pos, {static_cast<char const*>(data), static_cast<std::size_t>(size)});
    default:
        return comparison.Number(key, pos, static_cast<long double>(FromOctets<long long>(data)));
    }
}

void TellValue(ipp_attribute_t* attribute, int i, int pos, COMPARISON& comparison)
{
    char const* const key = ippGetName(attribute);
    switch (ippGetValueTag(attribute))
    {
    case IPP_TAG_INTEGER:
        return comparison.Number(key, pos, ippGetInteger(attribute, i));
    case IPP_TAG_TEXT:
        return comparison.Text(key, pos, ippGetString(attribute, i, nullptr));
    default:
        int size = 0;
        void const* const data = ippGetOctetString(attribute, i, &size);
        return TellOctets(key, pos, data, size, comparison);
    }
}

class IPP_PEER : public PEER
{
public:
    std::string_view Write(SETMULTIPAR* table) override
    {
        written.clear();
        IPP const message = Message(table);
        ipp_state_t state = IPP_STATE_IDLE;
        while (state != IPP_STATE_DATA && state != IPP_STATE_ERROR)
            state = ippWriteIO(&written, Append, 1, nullptr, message.get());
        return written;
    }

    std::size_t Read(std::string_view bytes) override
    {
        IPP const message = Parsed(bytes);
        return message ? static_cast<std::size_t>(ippGetCount(ippFirstAttribute(message.get()))) : 0;
    }

    std::shared_ptr<void> Keep(std::string_view bytes) override { return Parsed(bytes); }

    void Tell(std::string_view bytes, COMPARISON& comparison) override
    {
        IPP const message = Parsed(bytes);
        if (!message)
            return;
        for (ipp_attribute_t* attribute = ippFirstAttribute(message.get()); attribute;
             attribute = ippNextAttribute(message.get()))
        {
            int const count = ippGetCount(attribute);
            for (int i = 0; i < count; ++i)
                TellValue(attribute, i, count == 1 ? -1 : i, comparison);
        }
    }

private:
    std::string written;
};
}  // namespace

std::unique_ptr<PEER> MakeIpp() { return std::make_unique<IPP_PEER>(); }
