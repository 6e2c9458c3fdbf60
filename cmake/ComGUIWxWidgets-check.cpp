// Links only where wxWidgets was built with the C++ standard library of whoever compiles this: the name of
// its function holds that of a class of the standard library.
#include <iostream>
#include <wx/log.h>

int main()
{
#if wxUSE_LOG && wxUSE_STD_IOSTREAM
    wxLogStream const stream(&std::cerr);
#endif
}
