#include "comgui/ticket/STRINGCACHE.h"

char const* STRINGCACHE::operator()(char const*& text) { return text = (*this)[text]; }

char const* STRINGCACHE::operator[](char const* text)
{
    return text ? texts.emplace(text).first->c_str() : nullptr;
}

void STRINGCACHE::clear() { texts.clear(); }
