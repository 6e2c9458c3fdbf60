#include "comgui/ticket/DUMMY_SLOTS.h"

int DUMMY_MSETPARAMETER(void*, int, int, char const*, PARAM_TYPE, void const*, int) { return 1; }

int DUMMY_MSETMULTIPAR(void*, int, int, SETMULTIPAR*) { return 1; }

int DUMMY_MOPERATION(void*, int, int, TICKET_OP, void*) { return 1; }

int DUMMY_MENDISNOTIF(void*, int, int, int, bool, char const* const*) { return 1; }

int DUMMY_MLOCK(...) { return 1; }

int DUMMY_MSETNOTIFICATION(...) { return 1; }

int DUMMY_MSETNOTIFICATION2(...) { return 1; }
