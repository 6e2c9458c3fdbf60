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

    int port = 0;
    if (manager->GetSystemTicketParamForKey("System/MasterSOAPPort", PARAM_INT, &port, -1) != 0)
        std::printf("Logged in to the server at port %d\n", port);

    int const copies = 25;
    manager->SetParameter(3, 1, "Job/Copies", PARAM_INT, &copies, -1);  // the ticket of job 1

    manager->Logout();
    manager->Uninitialize();
}
