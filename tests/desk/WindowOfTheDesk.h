// The whole window at a server, driven as a user would, on a display that nobody sees. Controls are found by
// their accessible names.
#pragma once

#include "comgui/comgui.h"
#include "desk/view/MainFrame.h"
#include "desk/view/VirtualList.h"
#include "tests/client/Client.h"
#include "tests/client/TroubledPlugIn.h"
#include "tests/support/BundleOnDisk.h"
#include <chrono>
#include <comgui/client/Text.h>
#include <dlfcn.h>
#include <functional>
#include <gtest/gtest.h>
#include <optional>
#include <string>
#include <vector>
#include <wx/app.h>
#include <wx/dialog.h>
#include <wx/evtloop.h>
#include <wx/fileconf.h>
#include <wx/menu.h>
#include <wx/modalhook.h>
#include <wx/textctrl.h>

namespace desk
{
// Also for dialogs, which run a loop of their own.
inline void RunEvents()
{
    wxTheApp->ProcessPendingEvents();
    wxEventLoopBase::GetActive()->YieldFor(wxEVT_CATEGORY_ALL);
    wxMilliSleep(5);
}

template <typename Condition>
bool Await(Condition condition)
{
    for (auto const end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
         !condition() && std::chrono::steady_clock::now() < end;)
        RunEvents();
    return condition();
}

template <typename T>
T* Find(wxString const& name)
{
    return dynamic_cast<T*>(wxWindow::FindWindowByName(name));
}

class Rows
{
public:
    explicit Rows(wxString const& list) : m_list(Find<VirtualList>(list)) {}

    unsigned Count() const { return Model().GetCount(); }
    std::string Cell(unsigned row, unsigned column) const
    {
        wxVariant value;
        Model().GetValueByRow(value, row, column);
        return comgui::ToUtf8(value.GetString());
    }
    std::vector<std::string> Column(unsigned column) const
    {
        std::vector<std::string> cells;
        for (unsigned row = 0; row < Count(); ++row)
            cells.push_back(Cell(row, column));
        return cells;
    }
    std::optional<unsigned> RowOf(unsigned column, std::string const& text) const
    {
        for (unsigned row = 0; row < Count(); ++row)
            if (Cell(row, column).ends_with(text))
                return row;
        return std::nullopt;
    }
    void Select(unsigned row) const
    {
        m_list->SelectRow(row);
        wxDataViewEvent event(wxEVT_DATAVIEW_SELECTION_CHANGED, m_list, Model().GetItem(row));
        m_list->ProcessWindowEvent(event);
    }
    VirtualList* List() const { return m_list; }

private:
    wxDataViewVirtualListModel& Model() const
    {
        return *static_cast<wxDataViewVirtualListModel*>(m_list->GetModel());
    }
    VirtualList* m_list;
};

// Uses a dialog, once it is open, from within its own loop.
class DialogUser : public wxModalDialogHook
{
public:
    explicit DialogUser(std::function<void(wxDialog&)> use) : m_use(std::move(use)) { Register(); }
    ~DialogUser() override { Unregister(); }

private:
    int Enter(wxDialog* dialog) override
    {
        dialog->CallAfter([this, dialog] { m_use(*dialog); });
        return wxID_NONE;
    }
    std::function<void(wxDialog&)> const m_use;
};

// Gives this answer to the window's questions, unseen, and counts them.
class Answers : public wxModalDialogHook
{
public:
    explicit Answers(int answer) : m_answer(answer) { Register(); }
    ~Answers() override { Unregister(); }
    int Asked() const { return m_asked; }

private:
    int Enter(wxDialog*) override
    {
        ++m_asked;
        return m_answer;
    }
    int const m_answer;
    int m_asked = 0;
};

inline void Press(wxDialog& dialog, int button)
{
    wxCommandEvent click(wxEVT_BUTTON, button);
    click.SetEventObject(wxWindow::FindWindowById(button, &dialog));
    dialog.GetEventHandler()->ProcessEvent(click);
}

class WindowOfTheDesk : public Client
{
protected:
    WindowOfTheDesk()
    {
        delete wxConfigBase::Set(new wxFileConfig("desk", {}, (folder / "desk.conf").string()));
        frame->Show();
    }
    ~WindowOfTheDesk() override
    {
        frame->Close(true);
        RunEvents();
        delete wxConfigBase::Set(nullptr);
    }

    // The desk, and the other client that changes things.
    void Enter()
    {
        frame->LogIn(Here(), Admin());
        ASSERT_TRUE(Await([this] { return types.Count() > 0; }));
        LogIn();
    }
    // A plug-in that does wrong what it is ordered to; before the login.
    TROUBLE& BeginTrouble()
    {
        BundleOnDisk bundle(folder.Path());
        bundle.LinkExecutable(COMGUI_TROUBLED_PLUGIN);
        bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, "11111111-2222-3333-4444-555555555555",
                          "TroubledPlugInFactory");
        UtilityObjects::SetPlugInsFolder(folder.Path().native());
        return *static_cast<TROUBLE*>(
            dlsym(dlopen(COMGUI_TROUBLED_PLUGIN, RTLD_NOW | RTLD_LOCAL), "TroubledPlugInOrders"));
    }
    void ShowJob(comgui::TicketAddress job)
    {
        ASSERT_TRUE(Await([&] { return Choose(types, 0, "Jobs"); }));
        std::string const name = "3/" + std::to_string(job.id);
        ASSERT_TRUE(Await([&] { return Choose(shown, 0, name); }));
        ASSERT_TRUE(Await([&] { return heading() == "Jobs " + name; }));
    }
    static bool Choose(Rows const& rows, unsigned column, std::string const& text)
    {
        auto const row = rows.RowOf(column, text);
        if (row)
            rows.Select(*row);
        return row.has_value();
    }
    std::string ValueOf(std::string const& key) const
    {
        auto const row = keys.RowOf(0, key);
        return row ? keys.Cell(*row, 2) : "none";
    }
    void Menu(int id) const
    {
        wxCommandEvent event(wxEVT_MENU, id);
        frame->ProcessWindowEvent(event);
    }
    int MenuOf(wxString const& menu, wxString const& text) const
    {
        return frame->GetMenuBar()->FindMenuItem(menu, text);
    }
    // As an edit in the cell ends.
    void Type(std::string const& key, std::string const& text) const
    {
        auto const row = keys.RowOf(0, key);
        ASSERT_TRUE(row);
        keys.List()->StartEditing(*row, 2);
        ASSERT_TRUE(Await([] { return Find<wxTextCtrl>("value editor") != nullptr; }));
        auto* const editor = Find<wxTextCtrl>("value editor");
        editor->SetValue(comgui::ToWx(text));
        wxCommandEvent enter(wxEVT_TEXT_ENTER, editor->GetId());
        enter.SetEventObject(editor);
        editor->GetEventHandler()->ProcessEvent(enter);
    }
    std::string Status() const { return comgui::ToUtf8(frame->GetStatusBar()->GetStatusText()); }

    std::function<std::string()> const heading = []
    { return comgui::ToUtf8(Find<wxWindow>("heading")->GetLabel()); };
    MainFrame* const frame = new MainFrame;
    Rows const types{"types"};
    Rows const shown{"tickets"};
    Rows const keys{"keys"};
    Rows const events{"events"};
    Rows const jobs{"jobs"};
};
}  // namespace desk
