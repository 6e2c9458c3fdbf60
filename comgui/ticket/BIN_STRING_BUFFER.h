// A BIN_STRING that owns its bytes.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/BIN_STRING.h"
#include <string>

class COMGUI_EXPORT BIN_STRING_BUFFER
{
public:
    // Copies the bytes. A view that is not valid gives an empty buffer with a null view.
    explicit BIN_STRING_BUFFER(BIN_STRING const& source);

    // The copy's view points at the copy's own bytes.
    BIN_STRING_BUFFER(BIN_STRING_BUFFER const& source);
    BIN_STRING_BUFFER& operator=(BIN_STRING_BUFFER const& source);
    ~BIN_STRING_BUFFER() = default;

    // The view of the bytes; it dies with the buffer and with the next assignment to it.
    BIN_STRING const* BinString() const { return &m_view; }

    // Byte by byte, as unsigned numbers, zero bytes included; a beginning stands before the whole.
    bool operator<(BIN_STRING_BUFFER const& other) const { return m_bytes < other.m_bytes; }

private:
    COMGUI_LOCAL void PointAtOwnBytes();

    std::string m_bytes;
    BIN_STRING m_view;
};
