#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/stream/container_items.h"
#include "comgui/stream/ticket_items.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include <climits>

using namespace comgui::detail;

namespace
{
constexpr char detectS_SIGNATURE[] = "\x09STICKET_1";  // the first item of every ticket stream, tag and text
static_assert(std::string_view(detectS_SIGNATURE).substr(1) == TicketSignature &&
              detectS_SIGNATURE[0] == TicketSignature.size());

bool BeginsWith(void const* data, unsigned long size, std::string_view text)
{
    return size >= text.size() && std::memcmp(data, text.data(), text.size()) == 0;
}

// The comparison is signed and looks at 32 bits of what is left. So a negative size fits: it moves the cursor
// back, as the other ends of these streams have it. Check keeps such streams out.
bool Fits(int payloadSize, unsigned long left)
{
    return payloadSize <= static_cast<int>(static_cast<unsigned int>(left));
}

// STICKET_OP_INVALID for a code that does not travel in streams, whatever MOPERATION makes of it.
TICKET_OP Accepted(int code)
{
    TICKET_OP op = STICKET_OP_INVALID;
    switch (code)
    {
    case 2:
    case STICKET_OP_SET_PARTIAL:
    case 7:
    case STICKET_OP_SET_MULTIPAR:
    case 105:
    case MTICKET_OP_DELETE:
    case 108:
        op.SetInt(code);
        break;
    default:
        break;
    }
    return op;
}

// A row of texts, each ended by a zero byte.
class TEXTS
{
public:
    TEXTS(void const* data, unsigned long size) : m_next(static_cast<char const*>(data)), m_left(size) {}

    // The next text; null if no zero byte is left.
    char const* Take()
    {
        void const* const end = m_left != 0 ? std::memchr(m_next, '\0', m_left) : nullptr;
        if (end == nullptr)
            return nullptr;
        char const* const text = m_next;
        m_next = static_cast<char const*>(end) + 1;
        m_left -= static_cast<unsigned long>(m_next - text);
        return text;
    }

    // Takes the header of a table of keys. False if another text stands there; none at all is good.
    bool TakePartialHeader()
    {
        char const* const header = Take();
        return header == nullptr || header == PartialHeader;
    }

private:
    char const* m_next;
    unsigned long m_left;
};
}  // namespace

int MTICKET_BINSTREAM::Detect(void const* data, unsigned long size)
{
    if (data == nullptr)
        return 0;
    if (BeginsWith(data, size, ContainerSignature))
        return 2;
    return BeginsWith(data, size, detectS_SIGNATURE) ? 1 : 0;
}

bool MTICKET_BINSTREAM::Check(void const* data, unsigned long size)
{
    if (data == nullptr)
        return size == 0;
    Read reader(data, size, false);
    while (reader.HasOperation())
    {
        int type;
        int id;
        TICKET_OP op = STICKET_OP_INVALID;
        if (reader.ParseOperation(type, id, op) != GET_TICKET_OK || !reader.PayloadReads())
            return false;
    }
    return reader.left == 0;
}

MTICKET_BINSTREAM::Read::Read(void const* data, unsigned long size, bool areFixed)
    : cursor(nullptr), left(size), fixPositions(areFixed)
{
    if (!BeginsWith(data, size, ContainerSignature))
        return;
    cursor = static_cast<char const*>(data) + ContainerSignature.size();
    left -= ContainerSignature.size();
}

MTICKET_BINSTREAM::eGetTicketResult MTICKET_BINSTREAM::Read::ParseOperation(int& ticketType, int& ticketId,
                                                                            TICKET_OP& operation)
{
    ticketType = -1;
    ticketId = -1;
    if (left == 0)
        return GET_TICKET_END;
    if (cursor == nullptr)
        return GET_TICKET_ERROR;
    try
    {
        int code;
        int size;
        GetInt(ticketType);
        GetInt(ticketId);
        GetInt(code);
        GetInt(size);
        if (!Fits(size, left))
            throw GET_TICKET_ERROR;
        op = operation = Accepted(code);
        if (op.GetInt() == STICKET_OP_INVALID)
            throw GET_TICKET_ERROR;
        SkipPayload(size);
        return GET_TICKET_OK;
    }
    catch (eGetTicketResult result)
    {
        payload = nullptr;
        payloadSize = 0;
        return result;
    }
}

// size: of the payload, negative as it may be; payloadSize is then huge, and more bytes are left than before.
void MTICKET_BINSTREAM::Read::SkipPayload(int size)
{
    payload = cursor;
    payloadSize = static_cast<unsigned long>(size);
    cursor = static_cast<char const*>(cursor) + size;
    left -= payloadSize;
}

// Whether a whole operation stands at the cursor.
bool MTICKET_BINSTREAM::Read::HasOperation() const
{
    if (cursor == nullptr || left < OperationHeader)
        return false;
    auto const size = GetBytes<std::uint32_t>(static_cast<unsigned char const*>(cursor) + PayloadSizeOffset);
    return size <= INT_MAX && size <= left - OperationHeader;
}

bool MTICKET_BINSTREAM::Read::PayloadReads() const
{
    switch (op.GetInt())
    {
    case STICKET_OP_SET_MULTIPAR:
        return STICKET_BINSTREAM::Check(payload, payloadSize);
    case STICKET_OP_SET_PARTIAL:
        return TEXTS(payload, payloadSize).TakePartialHeader();
    default:
        return true;
    }
}

MTICKET_BINSTREAM::eGetTicketResult MTICKET_BINSTREAM::Read::GetSetMultipar(SETMULTIPAR_LIST& list)
{
    list.Clear();
    bool const isRead = STICKET_BINSTREAM::Read(list, payload, payloadSize, fixPositions);
    return isRead ? GET_TICKET_OK : GET_TICKET_ERROR;
}

MTICKET_BINSTREAM::eGetTicketResult MTICKET_BINSTREAM::Read::GetPartialTable(char const* const*& keys)
{
    keys = nullptr;
    partial.clear();
    TEXTS texts(payload, payloadSize);
    if (!texts.TakePartialHeader())
        return GET_TICKET_ERROR;
    while (char const* const key = texts.Take())
        partial.push_back(key);
    if (partial.empty())
        return GET_TICKET_OK;
    partial.push_back(nullptr);
    keys = partial.data();
    return GET_TICKET_OK;
}

void MTICKET_BINSTREAM::Read::GetInt(int& value)
{
    if (cursor == nullptr || left < sizeof(std::uint32_t))
        throw GET_TICKET_ERROR;
    auto const* const bytes = static_cast<unsigned char const*>(cursor);
    value = static_cast<int>(GetBytes<std::uint32_t>(bytes));
    cursor = bytes + sizeof(std::uint32_t);
    left -= sizeof(std::uint32_t);
}
