#include "tests/module/ModuleUnderTest.h"

#include "comgui/foundation/stracpy.h"
#include "tests/support/TestSite.h"
#include <CoreFoundation/CoreFoundation.h>
#include <cstdlib>
#include <deque>
#include <dlfcn.h>
#include <stdexcept>

using comgui::test::TemporaryFolder;

namespace
{
using FACTORY = void* (*)(CFAllocatorRef, CFUUIDRef);

FACTORY Factory()
{
    char const* const other = std::getenv("COMGUI_TEST_MODULE");  // the trace, in front of the module
    void* const executable = dlopen(other ? other : COMGUI_MODULE_FILE, RTLD_NOW | RTLD_LOCAL);
    void* const factory =
        executable ? dlsym(executable, other ? "ComGUITraceFactory" : "ComGUIModuleFactory") : nullptr;
    if (!factory)
        throw std::runtime_error(dlerror());
    return reinterpret_cast<FACTORY>(factory);
}
// Made before the module first opens a site, and so removed after it has left them all.
TemporaryFolder const& NewFolder()
{
    static std::deque<TemporaryFolder> folders;
    return folders.emplace_back();
}
}  // namespace

void* MODULE::Make(char const* typeUuid)
{
    CFStringRef const text = CFStringCreateWithCString(kCFAllocatorDefault, typeUuid, kCFStringEncodingUTF8);
    CFUUIDRef const type = CFUUIDCreateFromString(kCFAllocatorDefault, text);
    void* const made = Factory()(nullptr, type);
    CFRelease(type);
    CFRelease(text);
    return made;
}

MODULE::MODULE()
{
    void* const object = Make(COMGUI_PLUGIN_TYPE_UUID);
    m_table = *static_cast<ComGUIModuleInterface const**>(object);
    m_table->Release(object);  // the table itself stays, as the executable does
    m_table->Open(&m_instance);
}

RECORD::RECORD(char const* user, char const* password, char const* host, int port) : TLogin{}
{
    nSize = sizeof(TLogin);
    stracpy(szUser, user, sizeof szUser);
    stracpy(szPassword, password, sizeof szPassword);
    stracpy(szServerHost, host, sizeof szServerHost);
    iServerPort = port;
    iLocalPort = 50106;
    iClientStamp = 30312656;
    iGUINotificationID = -1;
}

MODULE_AT_SITE::MODULE_AT_SITE() : folder(NewFolder()) { UseSite(folder.Path() / "site"); }

void MODULE_AT_SITE::UseSite(std::string const& site) { UseSiteIn(site); }

void* MODULE_AT_SITE::LogIn(char const* user, char const* password) const
{
    RECORD record(user, password);
    return module->LoginEntry(module.Instance(), &record) == 0 ? record.hSession : nullptr;
}
