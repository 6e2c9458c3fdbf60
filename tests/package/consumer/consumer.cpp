// Calls the library and has it load the installed plug-in bundle: headers, libraries and bundle of an
// installation belong together.
#include <comgui/comgui.h>

#include <cstdio>
#include <cstring>

int main()
{
    static_assert(__cplusplus == 201703L);

    char text[8];
    stracpy(text, "a host of its own", sizeof text);
    if (std::strcmp(text, "a host ") != 0)
    {
        std::puts("stracpy gives the wrong text");
        return 1;
    }
    wxString bundle;
    UtilityObjects::GetPlugInsPath(bundle, L"ComGUI.Bundle");
    std::printf("plug-in: %s\n", static_cast<char const*>(bundle.utf8_str()));

    ComGUIManager::GetInstance();
    if (hSTicketInstance == nullptr)
    {
        std::puts("the plug-in was not loaded");
        return 1;
    }
    std::puts("the plug-in is loaded");
    return 0;
}
