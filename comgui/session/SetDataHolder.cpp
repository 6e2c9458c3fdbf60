#include "comgui/session/SetDataHolder.h"

#undef NDEBUG  // declares what assert() calls; builds without assertions end here, too
#include <cassert>
#include <cstdlib>
#include <cstring>

namespace
{
// What assert(this->m_value) does; not the macro, since it would tell another name of function and source.
[[noreturn]] void Fail(unsigned int line)
{
    constexpr char Expression[] = "this->m_value";
    constexpr char Function[] = "SetDataHolder";
    constexpr char Source[] = "Ticket Server Layer/ComGUIManager";
#ifdef __APPLE__
    __assert_rtn(Function, Source, static_cast<int>(line), Expression);
#else
    __assert_fail(Expression, Source, line, Function);
#endif
}

// room: bytes of the copy, zero behind those of the value.
void* Copy(void const* value, std::size_t size, std::size_t room, unsigned int line)
{
    void* const copy = std::calloc(1, room);
    if (!copy)
        Fail(line);
    return std::memcpy(copy, value, size);
}

// Narrow texts will be read as wide ones: zeros enough for a wide end keep that read within the copy.
std::size_t RoomOfText(std::size_t size)
{
    constexpr std::size_t Wide = sizeof(wchar_t);
    return (size / Wide + 2) * Wide;
}
}  // namespace

SetDataHolder::SetDataHolder(wxString keyText, PARAM_TYPE type, void* value, int pos)
{
    std::memset(static_cast<void*>(this), 0, sizeof *this);  // with the gaps between the fields
    wxScopedCharBuffer const text = keyText.utf8_str();
    std::memcpy(key, text.data(), std::strlen(text.data()) + 1);  // whatever there is room for, by design
    m_type = type;
    m_pos = pos;
    if (type == PARAM_INT)
        m_value = Copy(value, sizeof(int), sizeof(int), __LINE__);
    else if (type == PARAM_DOUBLE)
        m_value = Copy(value, sizeof(double), sizeof(double), __LINE__);
    else if (type == PARAM_STRING)
    {
        std::size_t const size = std::strlen(static_cast<char const*>(value)) + 1;
        m_value = Copy(value, size, RoomOfText(size), __LINE__);
    }
}

SetDataHolder::~SetDataHolder()
{
    std::free(m_value);
    m_value = nullptr;
}
