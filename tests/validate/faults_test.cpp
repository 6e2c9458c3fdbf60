// Each fault that a plug-in may have is found by the checks that should find it, and by no other of the kind.
// COMGUI_ALL_CHECKS in the environment: by no other at all, which takes minutes.
#include "comgui/session/ComGUIModuleInterface.h"
#include "comgui/testing/TemporaryFolder.h"
#include "tests/support/BundleOnDisk.h"
#include "tests/support/sanitizers.h"
#include "tools/comgui_validate/Check.h"
#include "tools/comgui_validate/Run.h"
#include <algorithm>
#include <cstdlib>
#include <gmock/gmock.h>
#include <set>
#include <string>
#include <vector>

using comgui::test::TemporaryFolder;

namespace
{
using namespace validate;

struct PLANTED
{
    char const* fault;
    std::vector<std::string> found;  // by these checks
};

void PrintTo(PLANTED const& planted, std::ostream* out) { *out << planted.fault; }

// The faults of FaultyModule.cpp.
std::vector<PLANTED> const Faults{
    {"address-swapped", {"server.local-address"}},
    {"again-refused", {"session.again"}},
    {"alive-always", {"server.nobody"}},
    {"alive-never", {"server.alive"}},
    {"alive-says-no", {"commands.is-alive"}},
    {"any-interface", {"bundle.other-interface"}},
    {"append-replaces", {"values.append"}},
    {"bytes-end-at-0", {"values.each-type", "values.bytes"}},
    {"close-deletes", {"tickets.create-next", "tickets.close"}},
    {"close-fails", {"tickets.close"}},
    {"container-moves", {"container.stays", "notifications.after-logout", "notifications.of-others"}},
    {"count-32", {"values.count", "values.count-is-read-only"}},
    {"count-deletes", {"values.count-is-read-only"}},
    {"create-makes-nothing", {"tickets.create-next", "threads.four-tickets"}},
    {"create-repeats", {"tickets.create-next", "threads.four-tickets"}},
    {"created-elsewhere", {"tickets.create"}},
    {"death-locks", {"death.of-a-client"}},
    {"delete-does-nothing", {"values.delete", "values.delete-one"}},
    {"delete-one-does-nothing", {"values.delete-one"}},
    {"destroy-leaves-another", {"memory.destroy"}},
    {"entry-null", {"bundle.entries", "session.uninitialize"}},
    {"factory-null", {"memory.factory"}},
    {"fetched-differs", {"transfers.there-and-back", "transfers.async"}},
    {"file-not-opened", {"files.open"}},
    {"file-not-saved", {"files.missing", "files.change"}},
    {"folder-reads-on", {"commands.folders"}},
    {"initialize-changes-port", {"session.initialize"}},
    {"job-refused", {"transfers.job"}},
    {"key-pointers", {"notifications.one-key-pointer"}},
    {"keys-ignored", {"notifications.keys"}},
    {"keys-kept", {"notifications.keys"}},
    {"keys-trimmed", {"values.keys"}},
    {"login-endless-text", {"session.login"}},
    {"login-keeps-role", {"session.login"}},
    {"login-no-handle",
     {"session.login", "session.twice", "session.logout", "container.there", "notifications.register",
      "commands.is-alive", "commands.folders", "transfers.job", "threads.four-sessions"}},
    {"login-renames", {"session.login", "session.again"}},
    {"logins-collide", {"threads.four-sessions"}},
    {"logout-code", {"session.logout", "threads.another", "threads.four-sessions"}},
    {"logout-does-nothing", {"session.stale-handle", "notifications.after-logout"}},
    {"memory-appends-nothing", {"memory.append"}},
    {"memory-no-pointers", {"memory.each-type"}},
    {"memory-not-empty", {"memory.empty"}},
    {"memory-shared", {"memory.two", "files.change"}},
    {"memory-walk-skips", {"memory.walk"}},
    {"minus-1-is-0", {"values.starts-anew"}},
    {"missing-file-made", {"files.missing"}},
    {"missing-file-sent", {"session.stale-handle", "transfers.missing-file"}},
    {"narrow-int64", {"values.each-type", "values.limits"}},
    {"no-container", {"container.there"}},
    {"no-interface", {"bundle.interface"}},
    {"no-object", {"bundle.instance"}},
    {"null-handle-crash", {"session.null-handle"}},
    {"null-handle-succeeds", {"session.null-handle"}},
    {"odd-address-taken", {"tickets.odd-addresses"}},
    {"odd-key-crash", {"values.odd-keys"}},
    {"odd-position-hang", {"values.past-the-end", "values.odd-positions"}},
    {"off-does-nothing", {"tickets.odd-addresses", "notifications.off"}},
    {"off-twice-breaks", {"notifications.off-twice"}},
    {"open-fails", {"bundle.open"}},
    {"open-gives-null", {"container.system-ticket", "tickets.create-next", "tickets.open"}},
    {"open-missing-succeeds", {"tickets.open-missing", "tickets.delete"}},
    {"opened-reads-nothing", {"opened.values", "opened.tables", "tickets.open"}},
    {"opened-table-not-ok", {"opened.tables"}},
    {"option-unknown-1", {"options.unknown"}},
    {"order-turned", {"notifications.order"}},
    {"other-kind",
     {"notifications.change", "notifications.one-key-pointer", "notifications.order", "notifications.keys",
      "notifications.keeps-no-keys", "notifications.off", "notifications.off-twice",
      "notifications.of-others"}},
    {"other-user",
     {"notifications.change", "notifications.one-key-pointer", "notifications.order", "notifications.keys",
      "notifications.keeps-no-keys", "notifications.off", "notifications.off-twice",
      "notifications.of-others"}},
    {"partial-hides", {"tickets.partial"}},
    {"position-0-missing", {"values.position-0"}},
    {"prepare-says-no", {"commands.prepare"}},
    {"put-never", {"session.stale-handle", "transfers.async"}},
    {"read-touches", {"values.missing-key", "values.count"}},
    {"record-renamed", {"commands.is-alive", "commands.prepare"}},
    {"refusal-sticks", {"session.wrong-password", "session.unknown-user"}},
    {"register-code", {"notifications.register"}},
    {"register-no-id", {"notifications.register"}},
    {"release-frees", {"bundle.release"}},
    {"second-login-refused", {"session.twice", "threads.another"}},
    {"slot-null",
     {"container.slots", "tickets.open-missing", "tickets.create", "tickets.walk", "tickets.walk-stop"}},
    {"system-ticket-closed", {"container.system-ticket"}},
    {"table-always-ok", {"tables.ok-of-writes"}},
    {"table-backwards", {"tables.list"}},
    {"table-changes", {"bundle.table-stays"}},
    {"table-looks-behind", {"tables.empty"}},
    {"table-ok-left", {"tables.ok-of-reads", "tables.texts-together", "tables.list"}},
    {"table-reads-touch", {"tables.ok-of-reads"}},
    {"table-stops", {"tables.goes-on", "tables.ok-of-writes"}},
    {"table-texts-share", {"tables.texts-together"}},
    {"table-writes-records", {"tables.write"}},
    {"text-ascii", {"values.each-type", "values.texts"}},
    {"text-cut", {"values.long-text"}},
    {"text-goes", {"values.texts-stay", "tables.texts-together"}},
    {"thread-bound", {"threads.another", "threads.four-tickets"}},
    {"threads-share", {"threads.four-tickets"}},
    {"ticket-data-overruns", {"commands.ticket-data"}},
    {"ticket-stays", {"tickets.delete"}},
    {"tickets-double", {"tickets.walk", "tickets.walk-stop"}},
    {"tickets-go-on", {"tickets.walk-stop"}},
    {"transfer-keeps", {"session.stale-handle", "transfers.async", "transfers.keeps-nothing"}},
    {"translator-null", {"options.folder-variables"}},
    {"type-of-list", {"values.type"}},
    {"uninitialize-code", {"session.uninitialize"}},
    {"unknown-command-succeeds", {"session.stale-handle", "commands.unknown"}},
    {"walk-doubles", {"walks.each-value"}},
    {"walk-elsewhere", {"walks.on-this-thread"}},
    {"walk-flattens", {"walks.each-value", "walks.copy"}},
    {"walk-goes-on", {"walks.stop"}},
    {"walk-skips", {"walks.each-value", "walks.copy"}},
    {"walk-text-address", {"walks.each-value", "walks.copy"}},
    {"walk-without-table", {"tickets.open-missing", "tickets.create", "tickets.walk", "tickets.walk-stop"}},
    {"who-am-i-empty", {"options.who-am-i"}},
    {"who-am-i-wide", {"options.who-am-i"}},
    {"wide-read", {"values.each-type", "values.limits"}},
    {"write-clears-list", {"values.one-of-a-list"}},
    {"write-code-0", {"values.limits"}},
    {"write-keeps", {"values.keeps-nothing"}},
    {"wrong-password-accepted", {"session.wrong-password", "session.unknown-user"}},
};

class FaultyPlugIn : public testing::TestWithParam<PLANTED>
{
protected:
    FaultyPlugIn()
    {
        setenv("COMGUI_SITE", (folder / "site").c_str(), 1);
        setenv("COMGUI_FAULT", "", 1);
        bundle.LinkExecutable(COMGUI_FAULTY_MODULE);
        bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, "11111111-2222-3333-4444-555555555555",
                          "FaultyModuleFactory");
        options.bundle = bundle.Path();
        options.user = options.password = "admin";
        options.more["jobs"] = "yes";
        options.more["ticket-file"] = (folder / "site/tickets/SYS_0000.xml").string();
    }
    bool Fails(std::string const& name) const
    {
        auto const check = std::find_if(Checks().begin(), Checks().end(),
                                        [&name](Check const& each) { return each.name == name; });
        if (check == Checks().end())
            throw std::invalid_argument(name);
        return validate::Run(*check, options).outcome == Outcome::Failed;
    }

    TemporaryFolder folder;
    BundleOnDisk bundle{folder.Path()};
    Options options{};
};

std::string GroupOf(std::string const& check) { return check.substr(0, check.find('.')); }

// A fault may be of those that a sanitizer ends the process for, which is slow there.
std::set<std::string> Looked(PLANTED const& planted)
{
    std::set<std::string> checks(planted.found.begin(), planted.found.end());
    if (IsSanitized)
        return checks;
    std::set<std::string> groups;
    for (std::string const& check : planted.found)
        groups.insert(GroupOf(check));
    for (Check const& check : Checks())
        if (groups.count(GroupOf(check.name)) != 0 || std::getenv("COMGUI_ALL_CHECKS"))
            checks.insert(check.name);
    return checks;
}
}  // namespace

TEST_P(FaultyPlugIn, IsFound)
{
    ASSERT_FALSE(Fails("server.alive"));  // which makes the site
    setenv("COMGUI_FAULT", GetParam().fault, 1);
    options.limit = std::chrono::seconds(IsSanitized ? 15 : 4);
    std::vector<std::string> found;
    for (std::string const& check : Looked(GetParam()))
        if (Fails(check))
            found.push_back(check);
    EXPECT_THAT(found, testing::UnorderedElementsAreArray(GetParam().found));
}

INSTANTIATE_TEST_SUITE_P(Of, FaultyPlugIn, testing::ValuesIn(Faults),
                         [](auto const& planted)
                         {
                             std::string name = planted.param.fault;
                             std::replace(name.begin(), name.end(), '-', '_');
                             return name;
                         });

// --- bundles that are none

class BadBundle : public FaultyPlugIn
{
};

TEST_F(BadBundle, WithoutAnInfo_IsFound)
{
    std::filesystem::remove(bundle.InfoFile());
    EXPECT_TRUE(Fails("bundle.info-plist"));
    EXPECT_FALSE(Fails("bundle.factory"));
}

TEST_F(BadBundle, WithoutAFactoryForTheType_IsFound)
{
    BundleOnDisk const other(folder.Path(), "Other.Bundle");
    options.bundle = other.Path();
    EXPECT_TRUE(Fails("bundle.factory"));
    EXPECT_FALSE(Fails("bundle.instance"));
}

TEST_F(BadBundle, WithoutItsExecutable_IsFound)
{
    std::filesystem::remove(bundle.Executable());
    EXPECT_TRUE(Fails("bundle.instance"));
    EXPECT_FALSE(Fails("bundle.interface"));
}
