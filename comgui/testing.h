// The test kit: what tests of clients and of plug-ins need. Link comgui::testing.
//
//   ModuleFake      a plug-in in the test's own process that writes down calls and answers as it is told
//   TemporarySite   a site of the stand-in server with the server's own side: the real thing, for one test
//   ContainerFake   the table of a session's tickets, for code that takes one; writes down and fails as told
//   TicketFake      the same of a single ticket
//   Records         the tables of notifications and slots as values that matchers understand
//   TemporaryFolder a folder that goes with the test
//
// For plug-ins, in headers of their own since they need GoogleTest: TicketContract and ContainerContract,
// suites to instantiate over one's own tables. Link comgui::contracts, which compiles them into the test
// program.
#pragma once

#include "comgui/testing/ContainerFake.h"
#include "comgui/testing/ModuleFake.h"
#include "comgui/testing/Records.h"
#include "comgui/testing/TemporaryFolder.h"
#include "comgui/testing/TemporarySite.h"
#include "comgui/testing/TicketFake.h"
