// The loading of a bundle, step by step as the library does it. As in a host, it stays loaded to the end of
// the process.
#pragma once

#include "tools/comgui_validate/Trial.h"
#include <CoreFoundation/CoreFoundation.h>
#include <memory>
#include <string>

namespace validate
{
class Loader
{
public:
    explicit Loader(std::string const& folder);
    Loader(Loader const&) = delete;
    Loader& operator=(Loader const&) = delete;

    // Each needs those before it, and is true if the library could go on after it.
    bool HasInfo() const { return m_plugIn && m_hasInfo; }
    bool HasFactory() const;
    bool MakeInstance();
    bool HasTable() const;
    bool AskForInterface(char const* uuid);
    void ReleaseInstance();  // the factory's object
    bool Open(Module& module) const;

    void* Found() const { return m_found; }  // what the last question for an interface left
    std::unique_ptr<Module> Take() const;    // the module, not opened yet

private:
    CFPlugInRef m_plugIn = nullptr;
    bool m_hasInfo = false;
    void* m_instance = nullptr;
    void* m_found = nullptr;
};

// All steps; null if one fails.
std::unique_ptr<Module> Load(std::string const& folder);
}  // namespace validate
