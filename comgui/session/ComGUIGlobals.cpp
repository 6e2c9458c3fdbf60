#include "comgui/session/ComGUIGlobals.h"

STicketFactory* hSTicketInstance = nullptr;
void* hMTicketInstance = nullptr;
TLogin* tLogin = nullptr;
void* pTicketContainer = nullptr;
wchar_t const* pszFuncName = L"ComGetInterface";
