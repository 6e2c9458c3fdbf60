#include "comgui/ticket/TICKET_OP.h"

bool IsSTICKET_OP(int code) { return code < 100; }

bool IsMTICKET_OP(int code) { return code > 99; }
