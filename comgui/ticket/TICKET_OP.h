// Operation codes of tickets and containers. They share one number line: below 100 an operation of a
// single ticket, from 100 up one of the container. Only codes that the library issues or looks at have
// names; 2, 7, 105 and 108 travel in container streams and mean something to the module alone.
#pragma once

#include "comgui/foundation/export.h"
#include <type_traits>

enum STICKET_OP : int
{
    STICKET_OP_SET_PARTIAL = 3,        // MOPERATION; arg: a null-ended key table, char const* const*
    STICKET_OP_FOLDER_VARIABLES = 10,  // SOPTION only; out: address of a clFOLDER_VARIABLES*
    STICKET_OP_WHOAMI = 11,            // SOPTION only; out: a STICKET_OPTION_WHOAMI
    STICKET_OP_SET_MULTIPAR = 98,      // container streams only: the payload is a ticket stream
    STICKET_OP_INVALID = 99,           // no valid operation, in the stream reader
};

enum MTICKET_OP : int
{
    // arg: address of a STICKET_ACCESS const*, receives the ticket's table, which the module owns until
    // MTICKET_OP_CLOSE. Fails for a ticket that does not exist.
    MTICKET_OP_OPEN = 102,
    // id TICKET_ID_NEXT; arg: address of an int, receives the new id, 0 to 16,777,215, each time another.
    MTICKET_OP_CREATE_NEXT = 104,
    MTICKET_OP_DELETE = 106,  // arg: null; the ticket can be neither opened nor read afterwards
    MTICKET_OP_CLOSE = 107,   // arg: address of a bool; ends MTICKET_OP_OPEN, the ticket itself stays
    // type and id -1; arg: address of a clFOLDER_VARIABLES*, receives a translator that stays the module's.
    MTICKET_OP_FOLDER_VARIABLES = 110,
};

extern "C"
{
    // Signed tests, so a negative code counts as a single ticket's.
    COMGUI_EXPORT bool IsSTICKET_OP(int code);  // below 100
    COMGUI_EXPORT bool IsMTICKET_OP(int code);  // above 99
}

// Either kind of code in one 32-bit word, passed by value to the slot MOPERATION.
class TICKET_OP
{
public:
    constexpr TICKET_OP(STICKET_OP op) : code(op) {}
    constexpr TICKET_OP(MTICKET_OP op) : code(op) {}

    constexpr int GetInt() const { return code; }
    constexpr void SetInt(int value) { code = value; }

    // The code as it is, also where it is a container's: the caller has asked IsSTICKET_OP before.
    constexpr operator STICKET_OP() const { return static_cast<STICKET_OP>(code); }

private:
    int code;
};
static_assert(sizeof(TICKET_OP) == 4 && std::is_trivially_copyable_v<TICKET_OP>);
