// A host's view of the stand-in server: a site of the test's own, and a manager of the process.
#pragma once

#include "comgui/comgui.h"
#include "comgui/testing/TemporaryFolder.h"
#include <cstdlib>
#include <gtest/gtest.h>

using comgui::test::TemporaryFolder;

class Host : public testing::Test
{
protected:
    Host() { UseSite(folder.Path() / "site"); }

    static void UseSite(std::filesystem::path const& site) { setenv("COMGUI_SITE", site.c_str(), 1); }

    static ComGUIManager& Manager() { return *ComGUIManager::GetInstance(); }

    static int LogIn(char const* user = "admin", char const* password = "admin")
    {
        Manager().Initialize(user, password, "localhost", 50000);
        return Manager().Login(user, password, "localhost", 50000);
    }

    static TLogin Record(char const* user = "operator", char const* password = "operator")
    {
        TLogin login = {};
        login.nSize = sizeof login;
        stracpy(login.szUser, user, sizeof login.szUser);
        stracpy(login.szPassword, password, sizeof login.szPassword);
        stracpy(login.szServerHost, "localhost", sizeof login.szServerHost);
        login.iServerPort = 50000;
        return login;
    }

    // A record that the manager may free.
    static TLogin* NewRecord(char const* user = "operator", char const* password = "operator")
    {
        auto* const login = static_cast<TLogin*>(std::calloc(1, sizeof(TLogin)));
        *login = Record(user, password);
        return login;
    }

    static int WriteInt(char const* key, int value)
    {
        return Manager().SetParameter(3, 1, key, PARAM_INT, &value, -1);
    }

    static int ReadInt(char const* key)
    {
        int value = -1;
        Manager().GetParameter(3, 1, key, PARAM_INT, &value, -1);
        return value;
    }

    TemporaryFolder folder;
};
