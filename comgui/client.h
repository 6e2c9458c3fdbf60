// The client kit: a modern layer above the library for authors of clients. Link comgui::client.
#pragma once

#include "comgui/client/Connection.h"
#include "comgui/client/Error.h"
#include "comgui/client/Event.h"
#include "comgui/client/EventNumbers.h"
#include "comgui/client/Executor.h"
#include "comgui/client/LiveTicket.h"
#include "comgui/client/Result.h"
#include "comgui/client/Snapshot.h"
#include "comgui/client/Subscription.h"
#include "comgui/client/Text.h"
#include "comgui/client/TicketAddress.h"
#include "comgui/client/Tickets.h"
#include "comgui/client/TransferProgress.h"
#include "comgui/client/Transfers.h"
#include "comgui/client/Value.h"
#include "comgui/client/Worker.h"
