// One ticket's parameters as bytes: the stream that begins with "STICKET_1", in memory or in a file. Nothing
// in it guards against damage, and one that was cut between two values still reads as a good one. A number
// loses its type: a reader gives back the smallest that holds it. docs/stream-formats.md tells the format and
// what else changes on the way. Nothing is thrown but by the item writers and readers, which are for those
// who put streams together or take them apart themselves. One thread at a time for each object.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <cstdio>
#include <string>
#include <string_view>

class SETMULTIPAR_LIST;
struct STICKET;  // a WRITE as an opaque handle

class COMGUI_EXPORT STICKET_BINSTREAM
{
public:
    class WRITE;
    class IMPORT_INTERN;

    // Puts the stream of a table, or of a ticket, into out, which stays as it is when the writing fails. The
    // size of out, in either case. Nothing to write gives no bytes at all. Sets the ok of each record.
    // reserve: how many bytes to expect, or 0. ticket must not be null, nor must the text of a record's key.
    static unsigned long Write(std::string& out, SETMULTIPAR* table, unsigned long reserve);
    static unsigned long Write(std::string& out, STICKET_ACCESS const* ticket, unsigned long reserve);

    // The same to a file of that UTF-8 name, which is overwritten. Whether all went well; a file that cannot
    // be filled is left behind as far as it came.
    static bool Write(char const* filename, SETMULTIPAR* table, unsigned long reserve);
    static bool Write(char const* filename, STICKET_ACCESS const* ticket, unsigned long reserve);

    // Adds what the stream holds to the list. False at the first error, with what came before it in the list.
    // No bytes are a good stream. fixPositions: the first value behind each key is given at -1 if it stands
    // at 0 or -2, which is how a table for a write begins a vector.
    static bool Read(SETMULTIPAR_LIST& list, void const* data, unsigned long size, bool fixPositions);

    // Whether Read would read the whole stream. Takes memory for one key alone.
    static bool Check(void const* data, unsigned long size);

    // Reads the stream and writes its records to the ticket in one call, whose success is the result. A
    // stream with an error does not touch the ticket, nor do no bytes, which are a success. False for a null
    // ticket and for one that cannot be written.
    static bool Read(STICKET_ACCESS const* ticket, void const* data, unsigned long size, bool fixPositions);

    // The same for a file, with fixed positions. True once the file could be opened, whatever is in it.
    static bool Read(STICKET_ACCESS const* ticket, char const* filename);

    // The action of a walk that writes each parameter. writer: the WRITE. False once that has failed.
    static bool ExportAction(void* writer, char const* key, PARAM_TYPE type, void const* value, int pos);

    // Whether a stream can hold that value: no pointers, no counts, and null only for PARAM_STRING, where it
    // counts as the empty text, and PARAM_NONE, where it must be.
    static bool Valid(PARAM_TYPE type, void const* value);

    // How many bytes both texts begin with alike.
    static unsigned long strsame(char const* previous, char const* key);

    // On to the position of the next value: one further within a vector, the same below 0.
    static void IncPos(int& pos);

    // The position to report for a value at pos, which moves on. fixNext: set if the value is the first
    // behind its key and 0 or -2 is to be told as -1; cleared.
    static int FixPos(bool& fixNext, int& pos);

    // Bytes of the file, which is then at its start; 0 if it cannot be told.
    static unsigned long fsize(FILE* file);

private:
    class RECORDS;

    COMGUI_LOCAL static bool ReadAll(SETMULTIPAR_LIST* list, void const* data, unsigned long size,
                                     bool fixPositions);
};

// Writes one stream: made, fed, read out once by Swap or ToFile.
class COMGUI_EXPORT STICKET_BINSTREAM::WRITE
{
public:
    explicit WRITE(unsigned long reserve);

    // Adds one value; true if it was written. A value that is not Valid is passed over. If the writing fails
    // (no memory, a text of 128 MiB or more, a position below -2), what was written is no stream, and every
    // further value is refused.
    bool SetParameter(char const* key, PARAM_TYPE type, void const* value, int pos);

    // The same for each record of the table, whose ok takes the result. Null does nothing.
    void SetMultiParameter(SETMULTIPAR* table);

    // The same through an opaque handle; a null one does nothing.
    static bool SetParameter(STICKET* writer, char const* key, PARAM_TYPE type, void const* value, int pos);
    static void SetMultiParameter(STICKET* writer, SETMULTIPAR* table);

    bool Failed() const { return failed; }

    // Exchanges the stream for the contents of out.
    void Swap(std::string& out) { data.swap(out); }

    // Writes the stream to a file of that UTF-8 name. Whether all bytes were written.
    bool ToFile(char const* filename) const;

    // One item, or part of one. tag: the class of the item, in the top three bits. A size of 128 MiB or more
    // throws the char const* "Tag size overflow", 2^30 or more shared bytes "Key same overflow".
    void PutTag(unsigned char tag, unsigned long size);
    void PutString(unsigned char tag, char const* text);
    void PutKeyOpt(unsigned long shared, char const* tail);
    void PutTInteger(int value);
    void PutOptimizedTDouble(double value);
    void PutTInt64(long long value);
    void PutTUnsigned64(unsigned long long value);
    void PutTPoly64(unsigned long long value, char marker);
    void PutTFloat(float value);
    void PutTDouble(double value);
    void PutTBinString(BIN_STRING const& value);
    void PutUShort(unsigned short value);
    void PutUnsigned(unsigned int value);

private:
    template <typename... T>
    COMGUI_LOCAL void Append(char* (*put)(char*, T...), T... value);

    std::string data;
    bool first = true;    // the signature is still to be written
    std::string lastKey;  // the signature does not count as one
    int pos = -1;         // where the next value stands unless told otherwise
    bool failed = false;
};

// A cursor over a stream. Each member takes bytes and moves on, or throws a char const* that says what is
// wrong and leaves the cursor of no further use.
class COMGUI_EXPORT STICKET_BINSTREAM::IMPORT_INTERN
{
public:
    // The bytes must outlive the cursor.
    IMPORT_INTERN(void const* data, unsigned long size);

    bool HasData() const { return bytes.left != 0; }

    unsigned char GetByte();
    void GetShort(short& value);
    void GetInt(int& value);
    void GetFloat(double& value);   // a byte that is not looked at, then a single
    void GetDouble(double& value);  // as GetFloat, NaN and infinities come as MathLib::NOT_A_DOUBLE_NUMBER
    void GetPoly64(PARAM_TYPE& type, unsigned long long& value);

    // The class of the next item, in the top three bits, and its size.
    unsigned char GetTag(unsigned long& size);

    void GetString(std::string& value, unsigned long size);

    // The next key, which also becomes the one that a later compressed key builds on. size: bytes of the
    // item.
    void GetKeyOpt(std::string& key, unsigned long size, bool compressed);

private:
    friend class STICKET_BINSTREAM;

    struct BYTES
    {
        unsigned char const* address;
        unsigned long left;

        // The only bounds check of the reader, and the only place that moves the cursor. The size is compared
        // with what is left; a size from the stream is never added to an address first.
        unsigned char const* Take(unsigned long size);
    };

    COMGUI_LOCAL unsigned char TakeTag(unsigned long& size);
    COMGUI_LOCAL bool TakeNumberTag(unsigned int forms, unsigned long& size);
    COMGUI_LOCAL int TakeInteger(unsigned long size);
    COMGUI_LOCAL double TakeDouble(unsigned long size);
    COMGUI_LOCAL std::string_view TakeKey(unsigned long size, bool compressed);
    COMGUI_LOCAL static unsigned long TakeShared(BYTES& item);
    std::string_view Key() const { return {previousKey.data(), previousText}; }

    BYTES bytes;
    std::string previousKey;  // with room for the longest key so far
    unsigned long previousSize = 0;
    unsigned long previousText = 0;  // bytes in front of the key's first zero byte
};
