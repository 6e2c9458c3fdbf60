// A client's own translator, which reads the folders one by one, while others change them.
#include "tests/module/NotificationListener.h"

#include "comgui/folders/FolderVariables.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include "comgui/ticket/folder_variables.h"
#include "tests/support/Allocations.h"
#include <cstdio>
#include <future>
#include <random>

using comgui::detail::Variables;

namespace
{
constexpr char Use[] = "System/UseFolderVariables";
constexpr char Install[] = "System/InstallFolder";
constexpr char Temp[] = "System/Folders/Temp";
constexpr char Print[] = "System/Folders/Print";

// The name between $( and ); empty if it does not begin so.
std::string VariableIn(std::string const& path)
{
    auto const end = path.find(')');
    return path.starts_with("$(") && end != path.npos ? path.substr(2, end - 2) : "";
}

// Hands on what the client reads of the system ticket, and does something before each read.
class WatchedContainer
{
public:
    explicit WatchedContainer(CLIENT const& client) : m_client(client)
    {
        m_container.Instance = this;
        m_container.MOPERATION = [](void* instance, int type, int id, TICKET_OP op, void* arg)
        { return static_cast<WatchedContainer*>(instance)->Open(type, id, op, arg); };
        m_ticket.Instance = this;
        m_ticket.SGETPARAMETER = [](void* instance, char const* key, PARAM_TYPE type, void* value, int pos)
        { return static_cast<WatchedContainer*>(instance)->Read(key, type, value, pos); };
    }

    MTICKET_ACCESS const* Access() const { return &m_container; }

    std::function<void(std::string const& key)> beforeRead;

private:
    int Open(int type, int id, TICKET_OP op, void* arg)
    {
        m_opened = op.GetInt() == MTICKET_OP_OPEN ? m_client.Open(type, id) : nullptr;
        if (!m_opened)
            return 0;
        *static_cast<STICKET_ACCESS const**>(arg) = &m_ticket;
        return 1;
    }
    int Read(char const* key, PARAM_TYPE type, void* value, int pos)
    {
        beforeRead(key);
        return m_opened->SGETPARAMETER(m_opened->Instance, key, type, value, pos);
    }

    CLIENT const& m_client;
    STICKET_ACCESS const* m_opened = nullptr;
    MTICKET_ACCESS m_container{};
    STICKET_ACCESS m_ticket{};
};

class FolderReaders : public ClientTest
{
protected:
    void SetUp() override
    {
        for (auto const* row = Variables; row->key; ++row)
            if (row->key != std::string(Install))
                admin.Delete(0, 0, row->key);
        admin.Delete(0, 0, Install);
        ASSERT_TRUE(admin.Write(0, 0, Use, 3));
    }

    bool Write(char const* key, std::string const& value) const
    {
        auto const* const access = admin.Access();
        return value.empty()
                   ? admin.Delete(0, 0, key) != 0
                   : access->MSETPARAMETER(access->Instance, 0, 0, key, PARAM_STRING, value.c_str(), -1) != 0;
    }

    // A translator that has read what was there; beforeRead changes it meanwhile. A failure if it spins,
    // which cannot be ended.
    std::unique_ptr<clFOLDER_VARIABLES> Load(std::function<void(std::string const& key)> beforeRead,
                                             std::string const& history = {})
    {
        WatchedContainer watched(other);
        watched.beforeRead = std::move(beforeRead);
        auto loaded = std::async(std::launch::async, [&] { return CreateFolderVariables(watched.Access()); });
        if (loaded.wait_for(std::chrono::seconds(60)) != std::future_status::ready)
        {
            std::fprintf(stderr, "the translator does not come to an end: %s\n", history.c_str());
            std::abort();
        }
        return std::unique_ptr<clFOLDER_VARIABLES>(loaded.get());
    }

    // One change before that key is read.
    auto Before(char const* key, std::function<void()> change)
    {
        return [key, change = std::move(change)](std::string const& read)
        {
            if (read == key)
                change();
        };
    }

    char const* Text(STICKET_ACCESS const* ticket, char const* key) const
    {
        char const* text = nullptr;
        return ticket->SGETPARAMETER(ticket->Instance, key, PARAM_STRING, &text, -1) ? text : nullptr;
    }

    // The system ticket for a session that does not see the folder on which Temp leans.
    STICKET_ACCESS const* OpenWithoutInstall()
    {
        EXPECT_TRUE(Write(Install, "/opt/it"));
        EXPECT_TRUE(Write(Temp, "$(INSTALL)/tmp"));
        EXPECT_TRUE(other.Limit(0, 0, {Use, Temp}));
        return other.Open(0, 0);
    }
    // As the library does; Temp is due then.
    void ReadUpToTemp(STICKET_ACCESS const* ticket) const
    {
        int use = 0;
        EXPECT_TRUE(ticket->SGETPARAMETER(ticket->Instance, Use, PARAM_INT, &use, -1));
        Text(ticket, Install);
    }
};
}  // namespace

TEST_F(FolderReaders, FolderThatLeansOnOneTheReaderHasMissed_IsReadResolved)
{
    auto const folders = Load(Before(Temp,
                                     [this]
                                     {
                                         EXPECT_TRUE(Write(Install, "/opt/it"));
                                         EXPECT_TRUE(Write(Temp, "$(INSTALL)/tmp"));
                                     }));
    EXPECT_EQ(folders->Decode("$(TEMP)/x", false), "/opt/it/tmp/x");
    EXPECT_EQ(folders->Decode("$(INSTALL)/x", false), "$(INSTALL)/x") << "which it has missed";
}

TEST_F(FolderReaders, FolderThatLeansOnOneReadResolved_IsReadAsItIs)
{
    auto const folders = Load(Before(Temp,
                                     [this]
                                     {
                                         EXPECT_TRUE(Write(Install, "/opt/it"));
                                         EXPECT_TRUE(Write(Temp, "$(INSTALL)/tmp"));
                                         EXPECT_TRUE(Write(Print, "$(TEMP)/print"));
                                     }));
    EXPECT_EQ(folders->Decode("$(PRINT)", false), "/opt/it/tmp/print");
}

TEST_F(FolderReaders, VariablesThatComeIntoUseMeanwhile_AreReadResolved)
{
    ASSERT_TRUE(Write(Install, "/opt/it"));
    ASSERT_TRUE(admin.Write(0, 0, Use, 2));  // nothing is decoded
    auto const folders = Load(Before(Temp,
                                     [this]
                                     {
                                         EXPECT_TRUE(admin.Write(0, 0, Use, 3));
                                         EXPECT_TRUE(Write(Temp, "$(INSTALL)/tmp"));
                                     }));
    EXPECT_EQ(folders->Encode("/opt/it/tmp/x"), "$(TEMP)/x");
}

TEST_F(FolderReaders, FolderThatNobodyCanResolve_IsReadAsMissing)
{
    auto const folders = Load(Before(Temp,
                                     [this]
                                     {
                                         EXPECT_TRUE(admin.Write(0, 0, Use, 0));  // then nobody looks
                                         EXPECT_TRUE(Write(Temp, "$(NOWHERE)/tmp"));
                                     }));
    EXPECT_EQ(folders->Decode("$(TEMP)/x", false), "$(TEMP)/x");
}

TEST_F(FolderReaders, FolderOutsideOfTheSessionsLimit_IsReadAsMissingAndThoseThatLeanOnItResolved)
{
    ASSERT_TRUE(Write(Install, "/opt/it"));
    ASSERT_TRUE(Write(Temp, "$(INSTALL)/tmp"));
    ASSERT_TRUE(other.Limit(0, 0, {Use, Temp}));
    auto const folders = Load([](std::string const&) {});
    EXPECT_EQ(folders->Decode("$(TEMP)/x", false), "/opt/it/tmp/x");
}

// Who reads single keys sees what was written.
TEST_F(FolderReaders, WhoReadsOtherwise_GetsTheTextThatIsThere)
{
    ASSERT_TRUE(Write(Install, "/opt/it"));
    ASSERT_TRUE(Write(Temp, "$(INSTALL)/tmp"));
    auto const* const ticket = other.Open(0, 0);
    int use = 0;
    EXPECT_STREQ(Text(ticket, Temp), "$(INSTALL)/tmp");
    EXPECT_TRUE(ticket->SGETPARAMETER(ticket->Instance, Use, PARAM_INT, &use, -1));
    EXPECT_STREQ(Text(ticket, Temp), "$(INSTALL)/tmp");
    EXPECT_TRUE(ticket->SGETPARAMETER(ticket->Instance, Use, PARAM_INT, &use, -1));
    EXPECT_STREQ(Text(ticket, Install), "/opt/it");
    EXPECT_STREQ(Text(ticket, Temp), "$(INSTALL)/tmp");
    EXPECT_STREQ(Text(ticket, Temp), "$(INSTALL)/tmp");
}

// The first folder after the beginning is due, and leans on one that was not read.
TEST_F(FolderReaders, WhoReadsATableOrWalksInBetween_GetsTheTextThatIsThere)
{
    auto const* const ticket = OpenWithoutInstall();
    ReadUpToTemp(ticket);
    EXPECT_STREQ(Text(ticket, Temp), "/opt/it/tmp") << "as the library reads";
    ReadUpToTemp(ticket);
    GETMULTIPAR table[1] = {};
    EXPECT_EQ(ticket->SGETMULTIPAR(ticket->Instance, table), 1);
    EXPECT_STREQ(Text(ticket, Temp), "$(INSTALL)/tmp");
    ReadUpToTemp(ticket);
    auto const action = [](void*, char const*, PARAM_TYPE, void const*, int) { return true; };
    EXPECT_EQ(ticket->SWALKPARAMETERS(ticket->Instance, action, nullptr, "none", 8000), 1);
    EXPECT_STREQ(Text(ticket, Temp), "$(INSTALL)/tmp");
    ReadUpToTemp(ticket);
    double number = 0;
    EXPECT_EQ(ticket->SGETPARAMETER(ticket->Instance, Use, PARAM_DOUBLE, &number, -1), 0);
    EXPECT_STREQ(Text(ticket, Temp), "$(INSTALL)/tmp");
}

// At whichever place the memory ends: what is not read is not touched.
TEST_F(FolderReaders, WithoutMemory_ReadNothingOrTheWholeText)
{
    auto const* const ticket = OpenWithoutInstall();
    bool hasFailed = true;
    int failures = 0;
    for (int n = 0; hasFailed && n < 1000; ++n)
    {
        ReadUpToTemp(ticket);
        char const* text = "untouched";
        int isRead = 0;
        {
            FailingAllocation const failing(n);
            isRead = ticket->SGETPARAMETER(ticket->Instance, Temp, PARAM_STRING, &text, -1);
            hasFailed = failing.HasHappened();
        }
        failures += hasFailed ? 1 : 0;
        EXPECT_STREQ(text, isRead ? "/opt/it/tmp" : "untouched") << n;
    }
    EXPECT_GT(failures, 0);
}

TEST_F(FolderReaders, WhoReadsAnotherPosition_GetsTheTextThatIsThere)
{
    auto const* const ticket = other.Open(0, 0);
    int use = 0;
    ASSERT_TRUE(ticket->SGETPARAMETER(ticket->Instance, Use, PARAM_INT, &use, -1));
    EXPECT_EQ(Text(ticket, Install), nullptr);
    ASSERT_TRUE(admin.Access()->MSETPARAMETER(admin.Access()->Instance, 0, 0, Temp, PARAM_STRING,
                                              "$(NOWHERE)/tmp", 1));
    char const* text = nullptr;
    ASSERT_TRUE(ticket->SGETPARAMETER(ticket->Instance, Temp, PARAM_STRING, &text, 1));
    EXPECT_STREQ(text, "$(NOWHERE)/tmp");
}

TEST_F(FolderReaders, ResolvedText_LivesAsLongAsAnyOther)
{
    auto const* const ticket = other.Open(0, 0);
    int use = 0;
    ASSERT_TRUE(ticket->SGETPARAMETER(ticket->Instance, Use, PARAM_INT, &use, -1));
    EXPECT_EQ(Text(ticket, Install), nullptr);
    ASSERT_TRUE(Write(Install, "/opt/it"));
    ASSERT_TRUE(Write(Temp, "$(INSTALL)/tmp"));
    char const* const text = Text(ticket, Temp);
    EXPECT_STREQ(text, "/opt/it/tmp");
    for (int i = 0; i < 100; ++i)
        ASSERT_TRUE(Write(Temp, "$(INSTALL)/tmp" + std::to_string(i)));
    EXPECT_STREQ(text, "/opt/it/tmp");
}

// Whatever is written between any two reads, accepted or refused: the translator comes to an end, and with
// folders that are paths.
TEST_F(FolderReaders, ManyChangesBetweenReads_NeverHoldTheTranslatorUp)
{
    std::mt19937 random(20);
    auto const among = [&](std::size_t count)
    { return std::uniform_int_distribution<std::size_t>(0, count - 1)(random); };
    constexpr std::size_t Rows = 6;  // few, so that they lean on one another
    std::string history;
    auto const change = [&]
    {
        if (among(4) == 0)
        {
            int const use = static_cast<int>(among(4));
            bool const isDone = admin.Write(0, 0, Use, use) != 0;
            history += (isDone ? " use=" : " use refused=") + std::to_string(use);
            return;
        }
        std::string const leaning = "$(" + std::string(Variables[among(Rows)].variable) + ")";
        std::string const values[] = {"",
                                      "/a",
                                      "/",
                                      leaning,
                                      leaning + "/b",
                                      leaning + "$(TEMP)",
                                      "$(NOPE)/c",
                                      "$(",
                                      "$(x\\",
                                      leaning + "/" + leaning};
        char const* const key = Variables[among(Rows)].key;
        std::string const value = values[among(std::size(values))];
        bool const isDone = Write(key, value);
        history += std::string(" ") + key + (isDone ? "=" : " refused=") + value;
    };
    for (int round = 0; round < 150; ++round)
    {
        history.clear();
        auto const folders = Load(
            [&](std::string const&)
            {
                for (std::size_t count = among(4); count > 0; --count)
                    change();
            },
            history);
        for (std::size_t row = 0; row < Rows; ++row)
        {
            std::string const form = "$(" + std::string(Variables[row].variable) + ")/x";
            std::string const decoded = folders->Decode(form, false);
            EXPECT_TRUE(decoded == form || GetFolderKey(VariableIn(decoded).c_str()) == nullptr)
                << decoded << ":" << history;
        }
    }
}
