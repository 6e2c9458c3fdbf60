// Prints where the host library expects ComGUI.Bundle.
#include "comgui/host/UtilityObjects.h"

#include <cstdio>

int main()
{
    wxString path;
    UtilityObjects::GetPlugInsPath(path, L"ComGUI.Bundle");
    std::fputs(path.utf8_str(), stdout);
}
