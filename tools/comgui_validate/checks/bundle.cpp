// The folder, its factory, and the table of entries.
#include "tools/comgui_validate/Loader.h"
#include "tools/comgui_validate/Session.h"
#include <cstring>
#include <string_view>

namespace validate
{
namespace
{
struct Word
{
    char const* name;
    void* value;
};

template <typename Function>
Word WordOf(char const* name, Function* function)
{
    return {name, reinterpret_cast<void*>(function)};
}

std::vector<Word> CalledEntries(ComGUIModuleInterface const& table)
{
    return {WordOf("QueryInterface", table.QueryInterface),
            WordOf("Release", table.Release),
            WordOf("Open", table.Open),
            WordOf("InitializeEntry", table.InitializeEntry),
            WordOf("IsAliveEntry", table.IsAliveEntry),
            WordOf("GetLocalAddressEntry", table.GetLocalAddressEntry),
            WordOf("LoginEntry", table.LoginEntry),
            WordOf("LogoutEntry", table.LogoutEntry),
            WordOf("UninitializeEntry", table.UninitializeEntry),
            WordOf("GetClientContainerEntry", table.GetClientContainerEntry),
            WordOf("GetTicketDataEntry", table.GetTicketDataEntry),
            WordOf("SendCommandEntry", table.SendCommandEntry),
            WordOf("PutFileEntry", table.PutFileEntry),
            WordOf("GetFileEntry", table.GetFileEntry),
            WordOf("SendJobEntry", table.SendJobEntry),
            WordOf("PutFileSyncEntry", table.PutFileSyncEntry),
            WordOf("GetFileSyncEntry", table.GetFileSyncEntry),
            WordOf("UninitializeAsyncEntry", table.UninitializeAsyncEntry)};
}

// Loads as far as it takes; a step before it that fails is another check's to tell.
void Need(bool isThere, char const* check)
{
    if (!isThere)
        throw Skipped(std::string("see ") + check);
}

void InfoPlist(Trial& trial)
{
    trial.Calling("CFPlugInCreate(" + Quoted(trial.GetOptions().bundle) + ")");
    trial.Expect("L1", Loader(trial.GetOptions().bundle).HasInfo(), "no bundle",
                 "a folder with Contents/Info.plist");
}

void Factory(Trial& trial)
{
    Loader const loader(trial.GetOptions().bundle);
    Need(loader.HasInfo(), "bundle.info-plist");
    trial.Calling("CFPlugInFindFactoriesForPlugInTypeInPlugIn(" COMGUI_PLUGIN_TYPE_UUID ")");
    trial.Expect("L2", loader.HasFactory(), "no factory", "one or more");
}

struct Made
{
    explicit Made(Trial& trial) : loader(trial.GetOptions().bundle)
    {
        Need(loader.HasInfo(), "bundle.info-plist");
        Need(loader.HasFactory(), "bundle.factory");
        trial.Calling("the factory for " COMGUI_PLUGIN_TYPE_UUID);
        isMade = loader.MakeInstance();
    }
    Loader loader;
    bool isMade = false;
};

void Instance(Trial& trial)
{
    Made made(trial);
    trial.Expect("L3", made.isMade, "null", "an object");
    trial.Expect("L3", made.loader.HasTable(), "an object whose first word is null",
                 "the address of its table");
}

struct Asked : Made
{
    explicit Asked(Trial& trial, char const* uuid = COMGUI_INTERFACE_UUID) : Made(trial)
    {
        Need(isMade && loader.HasTable(), "bundle.instance");
        trial.Calling(std::string("QueryInterface(object, ") + uuid + ", &out)");
        hasInterface = loader.AskForInterface(uuid);
    }
    bool hasInterface;
};

void Interface(Trial& trial)
{
    Asked const asked(trial);
    trial.Expect("L4", asked.hasInterface, "null", "an interface pointer");
    trial.Expect("L4", *static_cast<void**>(asked.loader.Found()), "a pointer to null",
                 "a pointer to the address of the table of entries");
}

void OtherInterface(Trial& trial)
{
    Asked const asked(trial, "00112233-4455-6677-8899-AABBCCDDEEFF");
    trial.Expect("L5", !asked.hasInterface, "an interface pointer", "an untouched out pointer");
}

void ReleaseOfTheInstance(Trial& trial)
{
    Asked asked(trial);
    Need(asked.hasInterface, "bundle.interface");
    auto const before = asked.loader.Take();
    trial.Calling("Release(object)");
    asked.loader.ReleaseInstance();
    // Whoever frees the table writes to it, or to what the heap puts in its place.
    std::vector<std::string> const churn(1000, std::string(sizeof(ComGUIModuleInterface) - 1, 'x'));
    trial.Calling("the interface pointer after Release");
    trial.Expect("L6", std::memcmp(&before->table, &before->Live(), sizeof before->table) == 0,
                 "a table with other words", "the same table");
}

void Entries(Trial& trial)
{
    Asked asked(trial);
    Need(asked.hasInterface, "bundle.interface");
    auto const module = asked.loader.Take();
    trial.Calling("nothing: the words of the table");
    for (Word const& word : CalledEntries(module->table))
        trial.Expect("L7", word.value, std::string(word.name) + " is null", "a function");
}

void Open(Trial& trial)
{
    Asked asked(trial);
    Need(asked.hasInterface, "bundle.interface");
    auto const module = asked.loader.Take();
    Need(reinterpret_cast<void*>(module->table.Open), "bundle.entries");
    trial.Calling("Open(&instance)");
    trial.Expect("L8", asked.loader.Open(*module), "a code", "0");
}

void TableStays(Trial& trial)
{
    Module& module = trial.GetModule();
    if (trial.GetOptions().user)
        Session const session(trial);
    trial.Calling("nothing: the words of the table after a session");
    trial.Expect("L9", std::memcmp(&module.table, &module.Live(), sizeof module.table) == 0,
                 "other words than after the loading", "the same words");
}
}  // namespace

std::vector<Check> BundleChecks()
{
    return {
        {"bundle.info-plist", InfoPlist},
        {"bundle.factory", Factory},
        {"bundle.instance", Instance},
        {"bundle.interface", Interface},
        {"bundle.other-interface", OtherInterface},
        {"bundle.release", ReleaseOfTheInstance},
        {"bundle.entries", Entries},
        {"bundle.open", Open},
        {"bundle.table-stays", TableStays},
    };
}
}  // namespace validate
