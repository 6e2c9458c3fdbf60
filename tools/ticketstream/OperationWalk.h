// Goes through a container stream operation by operation. Unlike the library's reader it trusts no size.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace ticketstream
{
struct Operation
{
    unsigned long offset = 0;  // of its first byte
    int ticketType = -1;
    int ticketId = -1;
    int code = 0;
    std::string_view payload;
    unsigned long payloadOffset = 0;
};

// What a payload is shown as.
enum class Payload
{
    None,
    Records,  // a ticket stream
    Keys,     // a table of keys
    Bytes,    // something between the one who wrote it and the module
};

class OperationWalk
{
public:
    // stream: begins with the signature of a container stream, and must outlive the walk.
    explicit OperationWalk(std::string_view stream);

    // Goes on to the next operation; false at the end. Throws BrokenStream, and is of no further use then.
    bool Next();

    Operation const& Current() const { return m_operation; }

private:
    std::string_view m_stream;
    unsigned long m_next;
    Operation m_operation;
};

// By the code, and for codes that say nothing of their payload by the payload itself.
Payload KindOf(Operation const& operation);

// One text of a table of keys, without its zero byte.
struct TableText
{
    unsigned long offset = 0;  // in the payload
    std::string_view text;
};

// The texts of the payload, first of them its header. Bytes behind the last zero byte count for nothing.
std::vector<TableText> TextsOf(std::string_view payload);

// Whether the texts are those of a table of keys.
bool IsKeyTable(std::vector<TableText> const& texts);

// Whether the operation would be read by itself. Asked of the library, which knows its codes.
bool IsGood(int code, std::string_view payload);
}  // namespace ticketstream
