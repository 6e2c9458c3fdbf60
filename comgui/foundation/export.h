// Marks what the shared library lets its users see; everything else stays hidden inside.
#pragma once

#define COMGUI_EXPORT __attribute__((visibility("default")))

// For the private helpers of an exported class.
#define COMGUI_LOCAL __attribute__((visibility("hidden")))
