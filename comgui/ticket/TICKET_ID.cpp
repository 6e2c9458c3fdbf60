#include "comgui/ticket/TICKET_ID.h"

bool TICKET_TYPE_Valid(int type) { return static_cast<unsigned>(type) < 100; }

bool TICKET_ID_Valid(int id) { return static_cast<unsigned>(id) >> 24 == 0; }

bool TICKET_Valid(int type, int id) { return TICKET_TYPE_Valid(type) && TICKET_ID_Valid(id); }

bool TICKETLOCK_ID_Valid(int id) { return static_cast<unsigned>(id) < 20; }

bool TICKETLOCK_OWNER_Valid(int owner) { return owner >= 0; }

bool TICKET_NOTIFICATION_Valid(int id) { return id >= 0; }
