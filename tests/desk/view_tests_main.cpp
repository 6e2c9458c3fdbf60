// Runs tests of views as a program with windows: on a display, and with a loop that brings events.
#include <gtest/gtest.h>
#include <wx/app.h>
#include <wx/evtloop.h>

class App : public wxApp
{
public:
    bool OnInit() override { return true; }
    int OnRun() override
    {
        wxGUIEventLoop loop;
        wxEventLoopActivator const activator(&loop);
        return RUN_ALL_TESTS();
    }
};

wxIMPLEMENT_APP_NO_MAIN(App);

int main(int argc, char** argv)
{
    testing::InitGoogleTest(&argc, argv);
    return testing::GTEST_FLAG(list_tests) ? RUN_ALL_TESTS() : wxEntry(argc, argv);
}
