#include "comgui/ticket/BIN_STRING_BUFFER.h"

BIN_STRING_BUFFER::BIN_STRING_BUFFER(BIN_STRING const& source)
{
    if (!source.valid())
        return;
    m_bytes.assign(static_cast<char const*>(source.data), source.size);
    PointAtOwnBytes();
}

// A short string keeps its bytes inside itself: the source's address would be wrong even after a move.
BIN_STRING_BUFFER::BIN_STRING_BUFFER(BIN_STRING_BUFFER const& source) : m_bytes(source.m_bytes)
{
    PointAtOwnBytes();
}

BIN_STRING_BUFFER& BIN_STRING_BUFFER::operator=(BIN_STRING_BUFFER const& source)
{
    if (this != &source)
    {
        m_bytes = source.m_bytes;
        PointAtOwnBytes();
    }
    return *this;
}

void BIN_STRING_BUFFER::PointAtOwnBytes()
{
    m_view = BIN_STRING();
    if (!m_bytes.empty())
        m_view.assign(m_bytes);
}
