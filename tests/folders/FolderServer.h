// A container with a system ticket that holds folders, both fakes, and translators that load from it.
#pragma once

#include "comgui/folders/FolderVariables.h"
#include "comgui/testing/ContainerFake.h"
#include "comgui/testing/TicketFake.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include <memory>
#include <string>

using comgui::test::ContainerFake;
using comgui::test::TicketFake;

class FolderServer
{
public:
    // flags: of System/UseFolderVariables.
    explicit FolderServer(int flags = 3)
    {
        container.AddTicket(0, 0);
        container.opened = systemTicket.Access();
        SetFlags(flags);
    }

    void SetFlags(int flags) { systemTicket.container.Put(0, 0, "System/UseFolderVariables", flags); }
    void SetFolder(char const* key, std::string const& folder)
    {
        systemTicket.container.Put(0, 0, key, folder.c_str());
    }

    std::unique_ptr<clFOLDER_VARIABLES> Translator()
    {
        return std::unique_ptr<clFOLDER_VARIABLES>(CreateFolderVariables(container.Access()));
    }

    ContainerFake container;  // opens the system ticket
    TicketFake systemTicket;
};

// A translator without a server, for mappings that a test sets itself.
inline std::unique_ptr<clFOLDER_VARIABLES> EmptyTranslator()
{
    return std::unique_ptr<clFOLDER_VARIABLES>(CreateFolderVariables(nullptr));
}
