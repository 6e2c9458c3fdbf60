// Calls the library and has it load the installed plug-in: headers, libraries and bundle of an installation
// belong together. It calls nothing of the host library, which must be linked all the same.
#include <comgui/comgui.h>

#include <cstring>
#include <fstream>
#include <iostream>
#include <string>

static_assert(__cplusplus == 201703L, "the public headers are for C++17");

// Where the plug-in's executable was loaded from, as the system knows it.
static std::string LoadedPlugIn()
{
    std::ifstream maps("/proc/self/maps");
    for (std::string line; std::getline(maps, line);)
    {
        if (line.find(COMGUI_BUNDLE_NAME "/") != std::string::npos)
            return line.substr(line.find('/'));
    }
    return {};
}

int main()
{
    char text[8];
    stracpy(text, "a host of its own", sizeof text);
    if (std::strcmp(text, "a host ") != 0)
    {
        std::cerr << "stracpy gives the wrong text\n";
        return 1;
    }
    ComGUIManager::GetInstance();
    if (hSTicketInstance == nullptr)
    {
        std::cerr << "the plug-in was not loaded\n";
        return 1;
    }
    std::cout << LoadedPlugIn() << '\n';
    return 0;
}
