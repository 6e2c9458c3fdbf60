// Where a test's programs have their site: in a folder, or, if COMGUI_TEST_ENGINE is postgresql, in a
// database of its own in the test program's cluster, with the folder for its files. So one suite runs over
// both.
#pragma once

#include <filesystem>

bool AreSitesInDatabases();

// Points this process, and the programs that it starts from now on, at the site with that folder. The same
// folder is the same site.
void UseSiteIn(std::filesystem::path const& folder);

// For a test of what only a folder has.
#define COMGUI_SKIP_IN_DATABASE(reason)                                                                      \
    if (AreSitesInDatabases())                                                                               \
    GTEST_SKIP() << "not of a site in a database: " reason
