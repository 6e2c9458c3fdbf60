// Folder paths in tickets, from the server's folders to what a host reads, through the library and the real
// bundle.
#include "tests/integration/Host.h"

#include <link.h>
#include <memory>
#include <string>

namespace
{
class FolderVariables : public Host
{
protected:
    FolderVariables() : operatorRecord(Record())
    {
        EXPECT_EQ(LogIn(), 0);
        EXPECT_EQ(Manager().InitializeBackward(&operatorRecord, 1), 0);
        EXPECT_EQ(Manager().LoginBackward(&operatorRecord), 0);
        container = Manager().GetBackwardContainer();
        EXPECT_NE(container, nullptr);
        EXPECT_EQ(Manager().SetParameter(3, 1, "Test/File", PARAM_STRING, "$(JOB)/x", -1), 1);
    }

    void SetJobFolder(char const* path)
    {
        EXPECT_EQ(Manager().SetParameter(0, 0, "System/Folders/Job", PARAM_STRING, path, -1), 1);
    }

    wxString ReadFromContainer() const
    {
        wxString value;
        MTICKET_READ::Of(container)->GetParameter(3, 1, "Test/File", value, -1);
        return value;
    }

    static wxString ReadFrom(STICKET_ACCESS const* ticket)
    {
        wxString value;
        STICKET_READ::Of(ticket)->GetParameter("Test/File", value, -1);
        return value;
    }

    wxString InSite(char const* rest) const
    {
        return wxString::FromUTF8((folder.Path() / "site" / rest).c_str());
    }

    TLogin operatorRecord;
    MTICKET_ACCESS const* container = nullptr;
};
}  // namespace

TEST_F(FolderVariables, PathReadFromATicket_IsResolved)
{
    EXPECT_EQ(ReadFromContainer(), InSite("job/x"));
    EXPECT_EQ(ReadFrom(MTICKET_READ::Of(container)->OpenTicket(3, 1)), InSite("job/x"));
}

TEST_F(FolderVariables, FolderThatTheAdministratorChanges_IsResolvedAnewAtTheNextRead)
{
    STICKET_ACCESS const* const ticket = MTICKET_READ::Of(container)->OpenTicket(3, 1);
    ASSERT_EQ(ReadFrom(ticket), InSite("job/x"));
    SetJobFolder("$(TEMP)/jobs");
    EXPECT_EQ(ReadFrom(ticket), InSite("temp/jobs/x"));
    EXPECT_EQ(ReadFromContainer(), InSite("temp/jobs/x"));
    SetJobFolder("/elsewhere");
    EXPECT_EQ(ReadFrom(ticket), "/elsewhere/x");
    EXPECT_EQ(ReadFromContainer(), "/elsewhere/x");
}

TEST_F(FolderVariables, SwitchedOff_LeavePathsAsTheyStand)
{
    int const off = 0;
    ASSERT_EQ(Manager().SetParameter(0, 0, "System/UseFolderVariables", PARAM_INT, &off, -1), 1);
    EXPECT_EQ(ReadFromContainer(), "$(JOB)/x");
}

TEST_F(FolderVariables, OfAnEndedSession_AreNotHandedOut)
{
    STICKET_ACCESS const* const ticket = MTICKET_READ::Of(container)->OpenTicket(3, 1);
    ASSERT_EQ(Manager().LogoutBackward(&operatorRecord), 0);
    EXPECT_EQ(MTICKET_READ::Of(container)->Decode("$(JOB)/x"), "$(JOB)/x");
    EXPECT_EQ(STICKET_READ::Of(ticket)->Decode("$(JOB)/x"), "$(JOB)/x");
}

TEST_F(FolderVariables, PlugInThatTranslates_UsesTheLibraryThatTheHostHasLoaded)
{
    ASSERT_EQ(ReadFromContainer(), InSite("job/x"));
    int copies = 0;
    dl_iterate_phdr(
        [](dl_phdr_info* loaded, std::size_t, void* count)
        {
            bool const isLibrary = std::string(loaded->dlpi_name).find("/libcomgui.") != std::string::npos;
            *static_cast<int*>(count) += isLibrary ? 1 : 0;
            return 0;
        },
        &copies);
    EXPECT_EQ(copies, 1);
}

TEST_F(FolderVariables, TranslatorOfTheHostsOwn_LoadsFromTheContainer)
{
    std::unique_ptr<clFOLDER_VARIABLES> const folders(CreateFolderVariables(container));
    EXPECT_TRUE(folders->IsEnabled());
    EXPECT_EQ(wxString::FromUTF8(folders->Decode("$(JOB)/x", false).c_str()), InSite("job/x"));
    SetJobFolder("/elsewhere");
    EXPECT_EQ(wxString::FromUTF8(folders->Decode("$(JOB)/x", false).c_str()), InSite("job/x"));
    folders->Load();
    EXPECT_EQ(folders->Decode("$(JOB)/x", false), "/elsewhere/x");
}
