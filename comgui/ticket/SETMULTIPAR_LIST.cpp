#include "comgui/ticket/SETMULTIPAR_LIST.h"

#include "comgui/ticket/LIST_CONTENTS.h"
#include <memory>
#include <new>

using comgui::detail::LIST_CONTENTS;

SETMULTIPAR_LIST::SETMULTIPAR_LIST(bool copyValues) : m_copyValues(copyValues)
{
    static_assert(sizeof(LIST_CONTENTS) <= sizeof m_contents);
    new (m_contents) LIST_CONTENTS;
}

SETMULTIPAR_LIST::~SETMULTIPAR_LIST() { std::destroy_at(&Contents()); }

LIST_CONTENTS& SETMULTIPAR_LIST::Contents()
{
    return *std::launder(reinterpret_cast<LIST_CONTENTS*>(m_contents));
}

LIST_CONTENTS const& SETMULTIPAR_LIST::Contents() const
{
    return *std::launder(reinterpret_cast<LIST_CONTENTS const*>(m_contents));
}

int SETMULTIPAR_LIST::xSetParameter(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    LIST_CONTENTS& contents = Contents();
    return contents.Add(contents.keys[key], type, contents.Kept(type, value), pos);
}

int SETMULTIPAR_LIST::ySetParameter(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    if (pos == 0)
        pos = -1;
    bool const isCopied = m_copyValues || type == PARAM_BINSTRING || type == PARAM_INT;
    LIST_CONTENTS& contents = Contents();
    return contents.Add(contents.keys[key], type, isCopied ? contents.Kept(type, value) : value, pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, int value, int pos)
{
    return xSetParameter(key, PARAM_INT, &value, pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, double value, int pos)
{
    return xSetParameter(key, PARAM_DOUBLE, &value, pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, std::string const& value, int pos)
{
    return xSetParameter(key, PARAM_STRING, value.c_str(), pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, wxString const& value, int pos)
{
    return xSetParameter(key, PARAM_STRING, value.utf8_str(), pos);
}

int SETMULTIPAR_LIST::SetParameter(char const* key, BIN_STRING const& value, int pos)
{
    return xSetParameter(key, PARAM_BINSTRING, &value, pos);
}

int SETMULTIPAR_LIST::DelParameter(char const* key, int pos)
{
    return xSetParameter(key, PARAM_NONE, nullptr, pos);
}

unsigned long SETMULTIPAR_LIST::Size() const { return Contents().records.Size(); }

SETMULTIPAR* SETMULTIPAR_LIST::Table(bool sort) { return Contents().Table(sort); }

void SETMULTIPAR_LIST::Clear() { Contents().Clear(); }

void SETMULTIPAR_LIST::freeTbl() { Contents().FreeTable(); }

bool SETMULTIPAR_LIST::CollectAction(void* list, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    if (comgui::detail::IsParameter(type))
        static_cast<SETMULTIPAR_LIST*>(list)->ySetParameter(key, type, value, pos);
    return true;
}
