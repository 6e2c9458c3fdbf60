// Why a ticket file cannot be read or written: what the window makes a sentence of. Plain values.
#pragma once

#include <cstddef>
#include <exception>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <variant>

namespace desk
{
enum class FileTrouble
{
    // Of the file. detail: what the system says.
    CannotRead,
    CannotWrite,
    NotAFile,  // a folder, a device
    TooLarge,  // the file, or what it would become in memory
    NoMemory,

    // Of its kind.
    Empty,
    UnknownForm,      // neither XML in UTF-8 nor a stream
    ContainerStream,  // of operations on many tickets

    // Of a stream, with the byte where the item begins.
    BrokenStream,   // detail: what the library's reader says
    HoldsDeletion,  // a change of a ticket, not a ticket
    BadPosition,    // none that a ticket can have; of XML too

    // Of XML, with the line. detail: the name, attribute or text that is wrong.
    NotUtf8,
    ControlCharacter,
    BrokenXml,  // detail: what the parser says
    DocumentType,
    NotATicket,  // another root, or none
    UnknownVersion,
    UnknownElement,
    UnknownAttribute,
    RepeatedAttribute,
    MissingAttribute,
    StrayText,
    BadReference,  // "&" with no character behind it
    UnknownType,
    UnknownEncoding,
    NotANumber,
    OutOfRange,
    NotBase64,
    RepeatedKey,
    RepeatedPosition,

    // Of both.
    BadKey,   // empty, too long or with a zero byte
    BadText,  // with a zero byte
};

struct FileFault
{
    FileTrouble trouble = FileTrouble::CannotRead;
    std::string file;                 // as it was given
    std::optional<std::size_t> line;  // from 1
    std::optional<std::size_t> byte;  // from 0
    std::string detail;               // a few bytes of any kind, as they were found; may be empty
};

template <typename T>
using FileResult = std::variant<T, FileFault>;

// A fault on its way out of a reader, and no further. A copy throws nothing.
class FaultThrown : public std::exception
{
public:
    explicit FaultThrown(FileFault fault) : m_fault(std::make_shared<FileFault const>(std::move(fault))) {}

    FileFault const& Fault() const { return *m_fault; }

private:
    std::shared_ptr<FileFault const> m_fault;
};
}  // namespace desk
