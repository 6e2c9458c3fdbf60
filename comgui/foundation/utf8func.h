// The one way in which the library opens a file by name.
#pragma once

#include "comgui/foundation/export.h"
#include <cstdio>

namespace utf8func
{
// The standard fopen for a path in UTF-8. The caller closes the file; null, with errno set, if it cannot be
// opened.
COMGUI_EXPORT FILE* fopen(char const* path, char const* mode);
}  // namespace utf8func
