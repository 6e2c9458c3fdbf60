// Everything public of the library in one include: what a host application needs, and what the author
// of a communication module needs.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/foundation/stracpy.h"
#include "comgui/host/UtilityObjects.h"
#include "comgui/session/ComGUIGlobals.h"
#include "comgui/session/ComGUIManager.h"
#include "comgui/session/ComGUIModuleInterface.h"
#include "comgui/session/STicketFactory.h"
#include "comgui/session/TLogin.h"
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/DUMMY_SLOTS.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include "comgui/ticket/STRINGCACHE.h"
#include "comgui/ticket/TICKET_ID.h"
#include "comgui/ticket/TICKET_OP.h"
