#include <comgui/comgui.h>
#include <cstdio>

int main()
{
    ComGUIManager* const manager = ComGUIManager::GetInstance();  // opens the communication plug-in
    if (!hSTicketInstance)
        return 1;  // it could not be opened, and stderr says why

    manager->Initialize("operator", "operator", "localhost", 50000);
    if (manager->Login("operator", "operator", "localhost", 50000) != 0)
        return 1;

    char const* name = nullptr;  // the text belongs to the plug-in
    if (manager->GetSystemTicketParamForKey("System/Name", PARAM_STRING, &name, -1) != 0)
        std::printf("Logged in to %s\n", name);

    int const copies = 25;
    manager->SetParameter(3, 1, "Job/Copies", PARAM_INT, &copies, -1);  // the ticket of job 1

    manager->Logout();
    manager->Uninitialize();
}
