// Reads and writes the tickets of a connection's session. A handle: copies are the same. For any thread,
// several at once. Without a session every operation answers NotLoggedIn, and ServerAway where the session is
// lost or replaced; a read that is under way during a logout fails or gives what was there before, as a
// whole.
#pragma once

#include "comgui/client/Snapshot.h"
#include "comgui/client/TicketAddress.h"
#include "comgui/client/Value.h"
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace comgui
{
namespace detail
{
class Client;
}

// The name of a key, UTF-8; refers to the text that it is made from, but for a std::string_view. Keys end at
// a zero byte, so a text with one is the name of none.
class KeyName
{
public:
    KeyName(char const* text) noexcept : m_text(text) {}
    KeyName(std::string const& text) noexcept
        : m_text(text.c_str()), m_isValid(text.find('\0') == std::string::npos)
    {
    }
    KeyName(std::string_view text)
        : m_copy(text), m_isCopied(true), m_isValid(text.find('\0') == std::string_view::npos)
    {
    }
    operator char const*() const noexcept { return m_isCopied ? m_copy.c_str() : m_text; }
    bool IsValid() const noexcept { return m_isValid; }

private:
    char const* m_text = nullptr;
    std::string m_copy;  // a view need not end at a zero byte
    bool m_isCopied = false;
    bool m_isValid = true;
};

constexpr int WholeKey = -1;  // as a position

// How texts that are paths into the server's folders are shown. In tickets they begin with a variable,
// "$(JOB)/7/page.pdf".
enum class Paths
{
    Resolved,  // "/srv/job/7/page.pdf"; written back in variable form where that means the same
    AsStored,
};

struct KeyInfo
{
    std::string key;
    PARAM_TYPE type = PARAM_NONE;         // PARAM_COUNT: a list
    PARAM_TYPE elementType = PARAM_NONE;  // of a list, of its first value
    int count = 0;                        // values; 1 unless it is a list
};

struct KeyValue
{
    std::string key;
    Value value;  // std::monostate deletes the key
};

class COMGUI_EXPORT Tickets
{
public:
    // Types that have tickets, and the tickets of a type, in ascending order. Error: NotLoggedIn.
    Result<std::vector<int>> Types() const;
    Result<std::vector<TicketAddress>> List(int type) const;

    // Makes an empty ticket under an id that the server chooses. Error: CreateRefused.
    Result<TicketAddress> Create(int type) const;
    Outcome Delete(TicketAddress ticket) const;
    bool Exists(TicketAddress ticket) const;

    // What the ticket holds, by key, bytewise. Error: NoSuchTicket.
    Result<std::vector<KeyInfo>> Keys(TicketAddress ticket) const;
    Result<Snapshot> ReadAll(TicketAddress ticket, Paths paths = Paths::Resolved) const;

    // pos: WholeKey, or 0 and up one value of a list. Errors: NoSuchTicket, NoSuchKey.
    Result<Value> Read(TicketAddress ticket, KeyName const& key, int pos = WholeKey,
                       Paths paths = Paths::Resolved) const;

    // As Value.h's As, with its types. Errors: also WrongType, OutOfRange.
    template <typename T>
    Result<detail::Readable<T>> ReadAs(TicketAddress ticket, KeyName const& key, int pos = WholeKey) const;

    // Replaces the key, or one value of a list; std::monostate deletes. The type is the value's, whatever the
    // key had. NotWritable: see ERROR_CODE; also a text or key with a zero byte. Errors: also NoSuchTicket,
    // WriteRefused.
    Outcome Write(TicketAddress ticket, KeyName const& key, Value const& value, int pos = WholeKey,
                  Paths paths = Paths::Resolved) const;

    // What a user has typed, by the type that each value has: see FromText. Errors: also NoSuchKey,
    // NotANumber, OutOfRange, BadList; then nothing is written.
    Outcome WriteText(TicketAddress ticket, KeyName const& key, std::string_view text,
                      int pos = WholeKey) const;

    // Many keys in one table; the outcome of each. The server takes it as one change.
    std::vector<Outcome> WriteAll(TicketAddress ticket, std::vector<KeyValue> const& values,
                                  Paths paths = Paths::Resolved) const;

    // The ticket as the XML of a ticket file, UTF-8.
    Result<std::string> ToXml(TicketAddress ticket) const;

    // A path with its variable resolved, and back; texts that are none stay as they are.
    std::string Resolved(std::string text) const;
    std::string Portable(std::string text) const;

private:
    friend class Connection;
    explicit Tickets(std::shared_ptr<detail::Client> client) : m_client(std::move(client)) {}

    std::shared_ptr<detail::Client> m_client;
};
}  // namespace comgui
