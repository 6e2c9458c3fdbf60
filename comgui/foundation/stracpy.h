#pragma once

#include "comgui/foundation/export.h"

// Copies a text into a fixed array of a record that crosses to the plug-in. At most size - 1 bytes of src
// are taken (the rest is cut off silently), everything behind them up to the array's last byte is zero, so
// that no old text is left for the other side to see. A null src counts as the empty text; with size 0
// nothing is touched. src may lie in dst itself.
extern "C" COMGUI_EXPORT void stracpy(char* dst, char const* src, unsigned long size);
