// The container reader behind Check. What Check says is told a second time here, from the bytes alone, and
// must be the same. What it accepts must walk to the end, read in every payload, and give the very same bytes
// when it is written again. What it refuses is kept from the reader, which trusts its payload sizes.
#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "fuzz/fuzz.h"
#include <optional>
#include <string_view>
#include <vector>

namespace
{
struct OPERATION
{
    std::uint32_t type, id, code;
    std::string payload;
};

std::uint32_t NumberAt(std::string_view bytes)
{
    std::uint32_t value = 0;
    for (char const byte : bytes.substr(0, 4))
        value = value << 8 | static_cast<std::uint8_t>(byte);
    return value;
}

bool IsPayloadGood(OPERATION const& operation)
{
    std::string const& payload = operation.payload;
    SETMULTIPAR_LIST list(false);
    if (operation.code == 98)
        return STICKET_BINSTREAM::Read(list, payload.data(), payload.size(), true);
    std::size_t const header = payload.find('\0');
    return operation.code != 3 || header == std::string::npos ||
           payload.substr(0, header) == "TICKET_PARTIAL_1";
}

// The operations of a good stream; none for any other.
std::optional<std::vector<OPERATION>> Operations(std::string_view bytes)
{
    std::vector<OPERATION> operations;
    if (bytes.empty())
        return operations;
    if (bytes.substr(0, 9) != "MTICKET_1")
        return {};
    for (bytes.remove_prefix(9); !bytes.empty(); bytes.remove_prefix(16 + operations.back().payload.size()))
    {
        if (bytes.size() < 16 || NumberAt(bytes.substr(12)) > bytes.size() - 16)
            return {};
        operations.push_back({NumberAt(bytes), NumberAt(bytes.substr(4)), NumberAt(bytes.substr(8)),
                              std::string(bytes.substr(16, NumberAt(bytes.substr(12))))});
        if (std::string_view("\2\3\7\x62\x69\x6A\x6C").find(static_cast<char>(operations.back().code)) ==
                std::string_view::npos ||
            operations.back().code > 255 || !IsPayloadGood(operations.back()))
            return {};
    }
    return operations;
}

// The texts behind the first; what no zero byte ends is none.
std::vector<std::string> Keys(std::string const& payload)
{
    std::vector<std::string> texts;
    std::size_t from = 0;
    for (std::size_t end; (end = payload.find('\0', from)) != std::string::npos; from = end + 1)
        texts.push_back(payload.substr(from, end - from));
    if (!texts.empty())
        texts.erase(texts.begin());
    return texts;
}

void MustGiveItsKeys(MTICKET_BINSTREAM::Read& reader, OPERATION const& operation)
{
    char const* const* keys = nullptr;
    auto const result = reader.GetPartialTable(keys);
    if (operation.code == 3)
        COMGUI_MUST(result == MTICKET_BINSTREAM::GET_TICKET_OK);
    if (result != MTICKET_BINSTREAM::GET_TICKET_OK)
        return;
    std::vector<std::string> read;
    for (; keys && *keys; ++keys)
        read.emplace_back(*keys);
    COMGUI_MUST(read == Keys(operation.payload));
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string const bytes(reinterpret_cast<char const*>(data), size);
    auto const operations = Operations(bytes);
    COMGUI_MUST(MTICKET_BINSTREAM::Check(data, size) == operations.has_value());
    COMGUI_MUST((MTICKET_BINSTREAM::Detect(data, size) == 2) == (bytes.substr(0, 9) == "MTICKET_1"));
    if (!operations)
        return 0;

    MTICKET_BINSTREAM::Read reader(data, size, false);
    MTICKET_BINSTREAM::Write writer(0);
    SETMULTIPAR_LIST list(false);
    int type;
    int id;
    TICKET_OP op = STICKET_OP_INVALID;
    for (OPERATION const& operation : *operations)
    {
        COMGUI_MUST(reader.ParseOperation(type, id, op) == MTICKET_BINSTREAM::GET_TICKET_OK);
        COMGUI_MUST(static_cast<std::uint32_t>(type) == operation.type);
        COMGUI_MUST(static_cast<std::uint32_t>(id) == operation.id);
        COMGUI_MUST(static_cast<std::uint32_t>(op.GetInt()) == operation.code);
        bool const isRead = reader.GetSetMultipar(list) == MTICKET_BINSTREAM::GET_TICKET_OK;
        COMGUI_MUST(isRead || operation.code != 98);
        MustGiveItsKeys(reader, operation);
        writer.PutOperation(type, id, op, operation.payload);
    }
    COMGUI_MUST(reader.ParseOperation(type, id, op) == MTICKET_BINSTREAM::GET_TICKET_END);

    std::string written;
    writer.GetAndClear(written);
    COMGUI_MUST(written == (operations->empty() ? "" : bytes));
    return 0;
}
