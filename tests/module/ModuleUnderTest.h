// The bundle's own executable, loaded as a host loads it, over a site of the test's own. Everything goes
// through the table that its factory makes.
#pragma once

#include "comgui/session/ComGUIModuleInterface.h"
#include "comgui/testing/TemporaryFolder.h"
#include <gtest/gtest.h>
#include <string>

using comgui::test::TemporaryFolder;

// The table and one instance of the module; the process loads it once.
class MODULE
{
public:
    MODULE();

    ComGUIModuleInterface const* operator->() const { return m_table; }
    ComGUIModuleInterface const& Table() const { return *m_table; }
    void* Instance() const { return m_instance; }

    // What the factory makes for a type; the caller releases it.
    static void* Make(char const* typeUuid);

private:
    ComGUIModuleInterface const* m_table;
    void* m_instance = nullptr;
};

// A record as a host fills it in, for the site that a new installation begins with.
struct RECORD : TLogin
{
    explicit RECORD(char const* user = "admin", char const* password = "admin",
                    char const* host = "localhost", int port = 50000);
};

// A module over a new site in a folder of its own.
class MODULE_AT_SITE
{
public:
    MODULE_AT_SITE();

    // Logs in and gives the session's handle; null if refused.
    void* LogIn(char const* user = "admin", char const* password = "admin") const;
    MTICKET_ACCESS const* Container(void* hSession) const
    {
        return module->GetClientContainerEntry(module.Instance(), hSession);
    }

    // Points the module at another site from now on.
    static void UseSite(std::string const& folder);

    TemporaryFolder const& folder;  // stays to the end of the process, as the site is open so long
    MODULE module;
};

class ModuleTest : public testing::Test, public MODULE_AT_SITE
{
};
