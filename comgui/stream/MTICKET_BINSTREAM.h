// Operations on the tickets of a container as bytes: the stream that begins with "MTICKET_1". Each operation
// names a ticket, a code and a payload: a ticket stream, or a table of keys that begins with
// "TICKET_PARTIAL_1". Nothing in this library carries operations out; the classes are for clients and for
// modules. One thread at a time for each object.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/TICKET_OP.h"
#include <string>
#include <vector>

class SETMULTIPAR_LIST;

class COMGUI_EXPORT MTICKET_BINSTREAM
{
public:
    class Write;
    class Read;

    enum eGetTicketResult : int
    {
        GET_TICKET_OK = 0,     // done
        GET_TICKET_END = 1,    // no data left
        GET_TICKET_ERROR = 2,  // a broken stream, or none
    };

    // What kind of stream begins with these bytes: 0 neither, also for null, 1 one ticket's, 2 a container's.
    static int Detect(void const* data, unsigned long size);

    // Whether a Read may be trusted with these bytes. It trusts the payload sizes that it finds: a negative
    // one leads it out of the buffer, and there is no other way to tell beforehand. True only if every
    // operation lies within the buffer, so that the walk ends with GET_TICKET_END and nothing that is asked
    // of the reader on its way looks outside; if the payload of each STICKET_OP_SET_MULTIPAR is a good ticket
    // stream and that of each STICKET_OP_SET_PARTIAL a good table of keys. Payloads of other codes mean
    // something to the module alone and may be anything. No bytes are a good stream. Takes memory for
    // one key alone, which is smaller than the stream; the list of a later GetSetMultipar may take far more
    // than the stream has bytes, since keys that begin alike are told briefly there.
    static bool Check(void const* data, unsigned long size);
};

// Puts operations together, one stream after another. Running out of memory throws std::bad_alloc and leaves
// the operation out.
class COMGUI_EXPORT MTICKET_BINSTREAM::Write
{
public:
    // reserve: how many bytes to expect in each stream, or 0.
    explicit Write(unsigned long reserve);

    // Gives the stream out and begins a new one. Without an operation there are no bytes at all.
    void GetAndClear(std::string& out);

    // Adds an operation. payload: less than 2 GiB, or no reader gets past it.
    void PutOperation(int ticketType, int ticketId, TICKET_OP op, std::string const& payload);
    void PutVoidOperation(int ticketType, int ticketId, TICKET_OP op);

    // Adds a write of parameters, whose ok is set as in STICKET_BINSTREAM::Write. If there is nothing to
    // write or the writing fails, nothing is added. reserve: how many bytes to expect in the payload, or 0.
    void PutSetMultipar(int ticketType, int ticketId, SETMULTIPAR* table, unsigned long reserve);

    // The same with a ticket stream; an empty one adds nothing.
    void PutSetMultipar(int ticketType, int ticketId, std::string const& stream);

    // Adds an operation whose payload is a table of keys. keys: ended by a null pointer, or null for none.
    void PutPartialTableOperation(int ticketType, int ticketId, TICKET_OP op, char const* const* keys);

    // Four bytes of a stream that the caller puts together.
    void PutUnsigned(unsigned int value);

private:
    std::string data;
    unsigned long reserve;
    bool first = true;  // the signature is still to be written
};

// Goes through a stream from operation to operation. It trusts the stream: pass what comes from elsewhere
// through Check first.
class COMGUI_EXPORT MTICKET_BINSTREAM::Read
{
public:
    // The bytes are not copied and must outlive the reader and all that it gives out; null only with less
    // than 9 of them. fixPositions: for STICKET_BINSTREAM::Read.
    Read(void const* data, unsigned long size, bool fixPositions);

    // Goes on to the next operation and tells its ticket and its code. GET_TICKET_END if there is none left,
    // GET_TICKET_ERROR for a broken stream and for a code that does not travel in streams. Both tickets'
    // numbers are -1 unless they were read; op stays unless a code was looked at, and is STICKET_OP_INVALID
    // if that was refused. After an error there is no way to go on.
    eGetTicketResult ParseOperation(int& ticketType, int& ticketId, TICKET_OP& op);

    // Reads the payload of the current operation into the list, which is cleared first and keeps what was
    // read before an error. No payload is no error.
    eGetTicketResult GetSetMultipar(SETMULTIPAR_LIST& list);

    // The keys of the current operation's payload, ended by a null pointer; null if there are none. The table
    // lives until the next call or the end of the reader. GET_TICKET_ERROR for a payload that begins with
    // another text. Throws std::bad_alloc.
    eGetTicketResult GetPartialTable(char const* const*& keys);

    // Four bytes of the stream; throws GET_TICKET_ERROR if they are not there.
    void GetInt(int& value);

private:
    friend class MTICKET_BINSTREAM;

    COMGUI_LOCAL bool HasOperation() const;
    COMGUI_LOCAL bool PayloadReads() const;
    COMGUI_LOCAL void SkipPayload(int size);

    void const* cursor;  // of the next operation; null without a signature
    unsigned long left;
    bool fixPositions;
    TICKET_OP op = STICKET_OP_INVALID;  // of the current operation
    void const* payload = nullptr;
    unsigned long payloadSize = 0;
    std::vector<char const*> partial;  // the table last given out
};
