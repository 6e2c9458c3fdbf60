// A ticket as a readable file: what an owner edits, what lies beside the database for others to read, and
// the form of a ticket that lives in a file of its own.
//
//   <ticket version="1" type="3" id="1">
//       <parameter key="Job/Copies" type="int">2</parameter>
//       <parameter key="Job/Separations" type="string">
//           <value pos="0">Cyan</value>
//           <value pos="2">Black</value>
//       </parameter>
//   </ticket>
//
// type and id of the ticket may both be left out. A value alone at position 0 is the parameter's text.
// Types: int, double, string, binary, int64, unsigned, unsigned64; a value of another type than its
// parameter's says so. Doubles are the shortest text that reads back as the same bits; of a NaN only that
// it is one remains. White space in a string counts. Strings and keys that XML cannot carry (control
// characters, bytes that are no UTF-8) are base64 and say so (encoding, key-encoding); binary always is.
// Pointers are left out. Equal tickets give equal files.
//
// Holds its values itself; no thread rule beyond that of any plain object.
#pragma once

#include "standin/server/tickets/KeyFilter.h"
#include "standin/server/tickets/TicketAddress.h"
#include "standin/server/tickets/TicketSnapshot.h"
#include <cstddef>
#include <filesystem>
#include <functional>
#include <map>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

namespace standin
{
// The text is not what it should be: "FILE:LINE: reason" on one line. There is never half a result.
class XmlError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

class TicketXml
{
public:
    static constexpr std::size_t SizeLimit = std::size_t{64} << 20;  // bytes of a file: 64 MiB

    // Read throws FileError for a file that cannot be read, both throw XmlError for what stands in it.
    static TicketXml Read(std::filesystem::path const& file);
    static TicketXml Parse(std::string_view text, std::string const& name);

    // Replaces the file as a whole; throws FileError, also for more than Read would take.
    void Write(std::filesystem::path const& file) const;
    std::string Text() const;

    // What a ticket holds, without its pointers, of the keys that the limit selects.
    static TicketXml Of(std::optional<TicketAddress> address, TicketSnapshot const& ticket,
                        KeyFilter const* limit = nullptr);

    // Takes the place of what stood there. PARAM_NONE and PARAM_POINTER leave nothing there.
    void Put(std::string_view key, int pos, StoredValue const& value);

    // Every value, by key (bytewise) and position. What is handed out lives as long as it stands here.
    void Walk(std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take) const;

    std::optional<TicketAddress> address;

private:
    struct Value
    {
        StoredValue plain;  // without its bytes
        std::string bytes;
        StoredValue View() const;
    };
    std::map<std::string, std::map<int, Value>, std::less<>> m_parameters;
};
}  // namespace standin
