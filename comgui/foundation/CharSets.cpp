#include "comgui/foundation/CharSets.h"

#include "comgui/foundation/filter_bytes.h"
#include "comgui/foundation/stracpy.h"
#include <array>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string_view>

namespace
{
struct ESCAPE
{
    unsigned char byte;
    std::string_view text;
};

// In the order in which they are looked for.
constexpr ESCAPE Escapes[] = {
    {0x22, "&quot;"}, {0x26, "&amp;"},  {0x27, "&apos;"}, {0x3C, "&lt;"},
    {0x3E, "&gt;"},   {0xC4, "&#196;"}, {0xD6, "&#214;"}, {0xDC, "&#220;"},
    {0xDF, "&#223;"}, {0xE4, "&#228;"}, {0xF6, "&#246;"}, {0xFC, "&#252;"},
};

// Whether that many bytes from s on may follow a leading byte. Ends at the terminating zero, which may not.
bool AreFollowing(char const* s, int count)
{
    for (; count > 0; --count, ++s)
        if ((*s & 0xC0) != 0x80)
            return false;
    return true;
}
}  // namespace

void CharSets::Win2Utf8(char* dst, char const* src, unsigned long size) { stracpy(dst, src, size); }

std::string CharSets::Win2Utf8(std::string const& src) { return src; }

void CharSets::Win2Utf8Decomposed(char* dst, char const* src, unsigned long size) { stracpy(dst, src, size); }

std::string CharSets::Win2Utf8Decomposed(std::string const& src) { return src; }

void CharSets::Utf82Win(char* dst, char const* src, unsigned long size) { stracpy(dst, src, size); }

std::string CharSets::Utf82Win(std::string const& src) { return src; }

bool CharSets::NeedsConversion(char const*) { return false; }

bool CharSets::NeedsConversion(std::string const&) { return false; }

unsigned long CharSets::RequiredBufferSize(char const*) { return 0; }

unsigned long CharSets::RequiredBufferSize(std::string const&) { return 0; }

bool CharSets::IsUtf8Coded(char const* s)
{
    int const length = static_cast<int>(std::strlen(s));
    for (int i = 0; i < length; ++i)
    {
        int following = 0;
        if ((s[i] & 0xE0) == 0xC0)
            following = 1;
        else if ((s[i] & 0xF0) == 0xE0)
            following = 2;
        else if ((s[i] & 0xF1) == 0xF0)  // not 0xF8: every even byte from F0 on leads, no odd one does
            following = 3;
        if (following != 0 && AreFollowing(s + i + 1, following))
            return true;
    }
    return false;
}

bool CharSets::IsUtf8Coded(std::string const& s) { return IsUtf8Coded(s.c_str()); }

char* CharSets::DuplicateAndConvert(char const* src, DIRECTION, ALLOC_METHOD method)
{
    if (src == nullptr)
        return nullptr;
    std::size_t const size = std::strlen(src) + 1;
    void* const copy = method == ALLOC_MALLOC ? std::malloc(size) : new (std::nothrow) char[size];
    return copy ? static_cast<char*>(std::memcpy(copy, src, size)) : nullptr;
}

void CharSets::ReplaceConflictingXMLDataInString(std::string& s)
{
    // The scan is never taken back: each byte is replaced only behind the last place of those before it. An
    // inserted text holds none of these bytes but its first, which the scan has passed; so the places can all
    // be told beforehand, in the text as it was.
    std::array<ESCAPE const*, 256> escapeOf{};
    std::array<std::size_t, std::size(Escapes)> scanFrom{};
    std::size_t scan = 0;
    for (ESCAPE const& escape : Escapes)
    {
        escapeOf[escape.byte] = &escape;
        scanFrom[static_cast<std::size_t>(&escape - Escapes)] = scan;
        std::size_t const last = s.rfind(static_cast<char>(escape.byte));
        if (last != std::string::npos && last >= scan)
            scan = last + 1;
    }
    if (scan == 0)
        return;
    std::string escaped;
    escaped.reserve(s.size() * 2);
    for (std::size_t i = 0; i < s.size(); ++i)
    {
        ESCAPE const* const escape = escapeOf[static_cast<unsigned char>(s[i])];
        if (escape && i >= scanFrom[static_cast<std::size_t>(escape - Escapes)])
            escaped += escape->text;
        else
            escaped += s[i];
    }
    s = std::move(escaped);
}

void CharSets::DBCS::ReplaceAll(std::string& s, char from, char to)
{
    for (char& c : s)
        c = c == from ? to : c;  // stored always: so there is nothing to foresee, and many bytes go at once
}

std::size_t CharSets::DBCS::LastAsciiPos(std::string const& s) { return s.size() - 1; }

std::size_t CharSets::DBCS::find_last_of(std::string const& s, std::string const& set, std::size_t pos)
{
    return s.find_last_of(set, pos);
}

CharSets::FilterString::FilterString(bool bypass) : table()
{
    if (bypass)
        setBypass('\x00', '\xFF');
}

void CharSets::FilterString::setBypass(char first, char last)
{
    for (int c = static_cast<unsigned char>(first); c <= static_cast<unsigned char>(last); ++c)
        table[c] = static_cast<char>(c);
}

void CharSets::FilterString::setBypass(char const* bytes)
{
    for (; bytes && *bytes; ++bytes)
        setBypass(*bytes, *bytes);
}

void CharSets::FilterString::setRemove(char first, char last) { setReplace(first, last, '\0'); }

void CharSets::FilterString::setRemove(char const* bytes) { setReplace(bytes, '\0'); }

void CharSets::FilterString::setReplace(char first, char last, char with)
{
    for (int c = static_cast<unsigned char>(first); c <= static_cast<unsigned char>(last); ++c)
        table[c] = with;
}

void CharSets::FilterString::setReplace(char const* bytes, char with)
{
    for (; bytes && *bytes; ++bytes)
        setReplace(*bytes, *bytes, with);
}

std::string CharSets::FilterString::operator()(std::string const& s) const
{
    static comgui::detail::FILTER_BYTES* const filter = comgui::detail::QuickestFilterBytes();
    std::string result(s.size(), '\0');
    result.resize(filter(table, s.data(), s.size(), result.data()));
    return result;
}
