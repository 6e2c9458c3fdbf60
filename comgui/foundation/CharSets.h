// Texts and the bytes they are made of: telling UTF-8 from other codings, filtering, escaping for XML. What
// is called a conversion copies, since both its sides are UTF-8. Nothing is shared between calls, so they may
// come from any thread.
#pragma once

#include "comgui/foundation/export.h"
#include <cstddef>
#include <string>

namespace CharSets
{
// Which way to convert. Both ways copy.
enum DIRECTION : int
{
    WIN_TO_UTF8 = 0,
    UTF8_TO_WIN = 1,
};

// Where memory comes from, and so how the caller gives it back.
enum ALLOC_METHOD : int
{
    ALLOC_MALLOC = 0,  // free
    ALLOC_NEW = 1,     // delete[]; so is every other value
};

// The buffer forms are stracpy: the buffer is filled up with zeros, and what does not fit is cut off at a
// byte, be it in the middle of a character. A null src counts as the empty text.
COMGUI_EXPORT void Win2Utf8(char* dst, char const* src, unsigned long size);
COMGUI_EXPORT std::string Win2Utf8(std::string const& src);
COMGUI_EXPORT void Win2Utf8Decomposed(char* dst, char const* src, unsigned long size);
COMGUI_EXPORT std::string Win2Utf8Decomposed(std::string const& src);
COMGUI_EXPORT void Utf82Win(char* dst, char const* src, unsigned long size);
COMGUI_EXPORT std::string Utf82Win(std::string const& src);

// Always false, and always 0: there is nothing to convert.
COMGUI_EXPORT bool NeedsConversion(char const* s);
COMGUI_EXPORT bool NeedsConversion(std::string const& s);
COMGUI_EXPORT unsigned long RequiredBufferSize(char const* s);
COMGUI_EXPORT unsigned long RequiredBufferSize(std::string const& s);

// Whether there is at least one multi-byte sequence of UTF-8 in the text, which may be nonsense elsewhere.
// Plain ASCII has none. The text ends at its first zero byte; s is not null.
COMGUI_EXPORT bool IsUtf8Coded(char const* s);
COMGUI_EXPORT bool IsUtf8Coded(std::string const& s);

// A copy that the caller gives back as method says. Null for a null src, and if there is no memory.
COMGUI_EXPORT char* DuplicateAndConvert(char const* src, DIRECTION direction, ALLOC_METHOD method);

// Escapes what XML does not take as it is: its own five characters, and the German letters of Latin-1, which
// are found by their byte even inside UTF-8. For texts with one kind of conflict: the kinds are gone through
// by byte value, and what lies before the last find of one kind is not seen by those that follow it.
COMGUI_EXPORT void ReplaceConflictingXMLDataInString(std::string& s);

namespace DBCS
{
COMGUI_EXPORT void ReplaceAll(std::string& s, char from, char to);

// The position of the last byte; std::string::npos for the empty text.
COMGUI_EXPORT std::size_t LastAsciiPos(std::string const& s);

// As the member of std::string.
COMGUI_EXPORT std::size_t find_last_of(std::string const& s, std::string const& set, std::size_t pos);
}  // namespace DBCS

// Lets each byte of a text pass, removes it or puts another in its place. Of several rules for one byte the
// one set last holds. A range includes both ends, taken as unsigned, and is empty if first is above last; a
// list of bytes ends at its zero byte, and null is an empty one. Many threads may filter while none sets a
// rule.
class COMGUI_EXPORT FilterString
{
public:
    // All bytes pass (but 0, whose own value says that it goes), or all are removed.
    explicit FilterString(bool bypass);

    void setBypass(char first, char last);
    void setBypass(char const* bytes);
    void setRemove(char first, char last);
    void setRemove(char const* bytes);
    // with: 0 removes.
    void setReplace(char first, char last, char with);
    void setReplace(char const* bytes, char with);

    // What comes in the place of c; 0 if it is removed.
    char operator()(char c) const { return table[static_cast<unsigned char>(c)]; }

    std::string operator()(std::string const& s) const;

private:
    char table[256];
};
static_assert(sizeof(FilterString) == 256);
}  // namespace CharSets
