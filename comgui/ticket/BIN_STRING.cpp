#include "comgui/ticket/BIN_STRING.h"

void BIN_STRING::assign(std::string const& bytes)
{
    data = bytes.data();
    size = bytes.size();
}

bool BIN_STRING::valid() const { return data != nullptr && size != 0; }

unsigned char const* BIN_STRING::begin() const { return static_cast<unsigned char const*>(data); }

unsigned char const* BIN_STRING::end() const { return begin() + size; }
