#include "tools/ticketstream/OperationWalk.h"

#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "tools/ticketstream/ItemClass.h"
#include "tools/ticketstream/Trouble.h"
#include <cstring>

namespace ticketstream
{
namespace
{
constexpr unsigned long HeaderSize = 16;
constexpr char KeyTableHeader[] = "TICKET_PARTIAL_1";

std::string NoRoomFor(int size, unsigned long left)
{
    if (size < 0)
        return "negative payload size " + std::to_string(size);
    return "payload size " + std::to_string(size) + ", but only " + std::to_string(left) + " bytes are left";
}
}  // namespace

OperationWalk::OperationWalk(std::string_view stream)
    : m_stream(stream), m_next(std::strlen(ContainerSignature))
{
}

bool OperationWalk::Next()
{
    if (m_next == m_stream.size())
        return false;
    std::string_view rest = m_stream.substr(m_next);
    if (rest.size() < HeaderSize)
        throw BrokenStream(m_next, "the header of an operation takes 16 bytes, but only " +
                                       std::to_string(rest.size()) + " are left");
    STICKET_BINSTREAM::IMPORT_INTERN header(rest.data(), HeaderSize);
    int size;
    header.GetInt(m_operation.ticketType);
    header.GetInt(m_operation.ticketId);
    header.GetInt(m_operation.code);
    header.GetInt(size);
    rest.remove_prefix(HeaderSize);
    if (size < 0 || static_cast<unsigned long>(size) > rest.size())
        throw BrokenStream(m_next, NoRoomFor(size, rest.size()));
    if (!IsGood(m_operation.code, {}))
        throw BrokenStream(m_next, "operation code " + std::to_string(m_operation.code) +
                                       " does not travel in container streams");
    m_operation.offset = m_next;
    m_operation.payload = rest.substr(0, static_cast<unsigned long>(size));
    m_operation.payloadOffset = m_next + HeaderSize;
    m_next = m_operation.payloadOffset + m_operation.payload.size();
    return true;
}

Payload KindOf(Operation const& operation)
{
    std::string_view const payload = operation.payload;
    if (payload.empty())
        return Payload::None;
    if (operation.code == STICKET_OP_SET_MULTIPAR)
        return Payload::Records;
    if (operation.code == STICKET_OP_SET_PARTIAL)
        return Payload::Keys;
    if (MTICKET_BINSTREAM::Detect(payload.data(), payload.size()) == 1)
        return Payload::Records;
    bool const isTable =
        payload.substr(0, sizeof KeyTableHeader) == std::string_view(KeyTableHeader, sizeof KeyTableHeader);
    return isTable ? Payload::Keys : Payload::Bytes;
}

std::vector<TableText> TextsOf(std::string_view payload)
{
    std::vector<TableText> texts;
    unsigned long from = 0;
    for (unsigned long end; (end = payload.find('\0', from)) != std::string_view::npos; from = end + 1)
        texts.push_back({from, payload.substr(from, end - from)});
    return texts;
}

bool IsKeyTable(std::vector<TableText> const& texts)
{
    return texts.empty() || texts.front().text == KeyTableHeader;
}

bool IsGood(int code, std::string_view payload)
{
    TICKET_OP op = STICKET_OP_INVALID;
    op.SetInt(code);
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutOperation(0, 0, op, std::string(payload));
    std::string stream;
    writer.GetAndClear(stream);
    return MTICKET_BINSTREAM::Check(stream.data(), stream.size());
}
}  // namespace ticketstream
