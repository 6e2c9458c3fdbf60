#include "comgui/foundation/utf8func.h"

FILE* utf8func::fopen(char const* path, char const* mode) { return std::fopen(path, mode); }
