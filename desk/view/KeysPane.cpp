#include "desk/view/KeysPane.h"

#include "desk/model/DisplayText.h"
#include "desk/model/TextMatch.h"
#include "desk/view/CellRenderers.h"
#include "desk/view/Theme.h"
#include <algorithm>
#include <comgui/client/Text.h>
#include <utility>
#include <wx/intl.h>
#include <wx/richtooltip.h>
#include <wx/sizer.h>

namespace desk
{
namespace
{
using Clock = std::chrono::steady_clock;

constexpr std::size_t NameLength = 400;   // characters in a cell
constexpr std::size_t ValueLength = 300;  // likewise
constexpr std::size_t FewKeys = 100;      // shown with all branches open
constexpr std::size_t ManyChanges = 200;  // taken as a whole
constexpr int FadingStep = 100;           // milliseconds

wxString NameOfType(comgui::Value const& value)
{
    return wxGetTranslation(comgui::NameOf(value.Type()), "comgui");
}

bool Contains(std::string_view text, std::string const& part) { return TextMatch(part).IsIn(text); }
}  // namespace

KeysPane::KeysPane(wxWindow* parent) : wxPanel(parent)
{
    m_heading = new wxStaticText(this, wxID_ANY, {});
    m_heading->SetName("heading");
    m_heading->SetFont(m_heading->GetFont().Bold());
    m_filter = new wxSearchCtrl(this, wxID_ANY);
    m_filter->SetName("filter of keys");
    m_filter->SetDescriptiveText(_("Filter keys and values"));
    m_filter->ShowCancelButton(true);
    m_list = new VirtualList(this, "keys", *this);
    m_list->AddColumn(
        _("Key"), 320,
        new OutlineRenderer([this](wxDataViewItem const& item) { Toggle(m_list->RowOf(item)); }));
    m_list->AddTextColumn(_("Type"), 80);
    m_list->AddColumn(_("Value"), 360,
                      new ValueRenderer([this] { return comgui::ToWx(comgui::ToText(m_begun)); },
                                        [this] { CallAfter([this] { RefuseEdit(); }); }));

    auto* const top = new wxBoxSizer(wxHORIZONTAL);
    top->Add(m_heading, wxSizerFlags(1).CenterVertical().Border());
    top->Add(m_filter, wxSizerFlags(1).Border());
    auto* const all = new wxBoxSizer(wxVERTICAL);
    all->Add(top, wxSizerFlags().Expand());
    all->Add(m_list, wxSizerFlags(1).Expand());
    SetSizer(all);

    m_filter->Bind(wxEVT_TEXT, [this](auto&) { Filter(); });
    m_filter->Bind(wxEVT_SEARCH_CANCEL, [this](auto&) { m_filter->Clear(); });
    m_list->Bind(wxEVT_DATAVIEW_ITEM_ACTIVATED,
                 [this](wxDataViewEvent& event)
                 {
                     unsigned const row = m_list->RowOf(event.GetItem());
                     IsEditable(row, ValueColumn) ? EditChosen() : Toggle(row);
                 });
    m_list->Bind(wxEVT_DATAVIEW_ITEM_START_EDITING,
                 [this](wxDataViewEvent& event)
                 {
                     unsigned const row = m_list->RowOf(event.GetItem());
                     m_edited = row < m_outline.RowCount() ? m_outline.PathAt(row) : std::string();
                     auto const* const value = ValueOf(m_edited);
                     m_begun = value ? *value : comgui::Value();
                     event.Skip();
                 });
    m_list->Bind(wxEVT_DATAVIEW_ITEM_EDITING_DONE,
                 [this](wxDataViewEvent& event)
                 {
                     CallAfter([this] { TakeLate(); });
                     event.Skip();
                 });
    m_list->Bind(wxEVT_CHAR_HOOK, &KeysPane::Move, this);
    m_fading.Bind(wxEVT_TIMER, [this](auto&) { Fade(); });
}

void KeysPane::ShowTicket(wxString const& heading)
{
    m_list->CancelEditing();
    m_late.reset();
    m_heading->SetLabelText(heading);
    m_content.Clear();
    m_isNew = true;
    m_outline.Show({});
    m_list->Reset();
}

void KeysPane::Take(comgui::Snapshot const& ticket,
                    std::vector<comgui::SnapshotDifference> const& differences)
{
    bool const isWhole = m_isNew || differences.size() > ManyChanges;
    bool const doRowsStay = !isWhole && !m_outline.IsFiltered() &&
                            std::ranges::all_of(differences, [](comgui::SnapshotDifference const& difference)
                                                { return difference.before && difference.after; });
    auto const now = Clock::now();
    if (m_late || (m_list->IsEditing() && !doRowsStay))
        m_late = ticket;
    else if (isWhole)
        TakeWhole(ticket, now);
    else if (doRowsStay)
        TakeEach(differences, now);
    else
        ChangeRows([&] { TakeEach(differences, now); });
    StartFading();
}

void KeysPane::TakeWhole(comgui::Snapshot const& ticket, TicketContent::Time now)
{
    ChangeRows(
        [&]
        {
            m_content.Show(ticket, now);
            m_outline.Show(m_content.Keys());
            if (m_isNew && m_content.Size() <= FewKeys)
                m_outline.OpenAll();
            m_list->Reset();
        });
    m_isNew = false;
}

void KeysPane::TakeEach(std::vector<comgui::SnapshotDifference> const& differences, TicketContent::Time now)
{
    for (comgui::SnapshotDifference const& difference : differences)
        TakeOne(difference, now);
}

void KeysPane::TakeOne(comgui::SnapshotDifference const& difference, TicketContent::Time now)
{
    m_content.Apply({difference.key, difference.after.value_or(comgui::Value())}, now);
    if (!difference.after)
        return Replace(m_outline.Remove(difference.key));
    Replace(difference.before ? m_outline.Recheck(difference.key) : m_outline.Insert(difference.key));
    if (auto const row = m_outline.RowOf(difference.key))
        m_list->RowChanged(static_cast<unsigned>(*row));
}

void KeysPane::TakeLate()
{
    if (m_late && !m_list->IsEditing())
    {
        TakeWhole(*std::exchange(m_late, std::nullopt), Clock::now());
        StartFading();
    }
}

void KeysPane::Explain(std::string const& key, wxString const& why) { ShowTip(key, _("Not written"), why); }

void KeysPane::RefuseEdit()
{
    ShowTip(m_edited, _("Not to be edited here"), _("The value is too long for the editor."));
}

void KeysPane::ShowTip(std::string const& key, wxString const& title, wxString const& why)
{
    auto const row = m_outline.RowOf(key);
    if (!row)
        return;
    wxRect const cell = m_list->CellOf(static_cast<unsigned>(*row), ValueColumn);
    wxRichToolTip tip(title, why);
    tip.SetIcon(wxICON_WARNING);
    tip.ShowFor(m_list, &cell);
}

std::optional<std::string> KeysPane::ChosenKey() const
{
    auto const row = m_list->Selected();
    return row && *row < m_outline.RowCount() ? m_outline.RowAt(*row).key : std::nullopt;
}

comgui::Value const* KeysPane::ValueOf(std::string const& key) const { return m_content.Find(key); }

void KeysPane::Choose(std::string const& key)
{
    ChangeRows([&] { Replace(m_outline.Reveal(key)); });
    SelectPath(key);
}

std::optional<std::string> KeysPane::ChosenPath() const
{
    auto const row = m_list->Selected();
    return row && *row < m_outline.RowCount() ? std::optional(m_outline.PathAt(*row)) : std::nullopt;
}

void KeysPane::SelectPath(std::string const& path)
{
    if (auto const row = m_outline.RowOf(path))
        m_list->SelectRow(static_cast<unsigned>(*row));
}

void KeysPane::EditChosen()
{
    if (auto const row = m_list->Selected())
        m_list->StartEditing(*row, ValueColumn);
}

void KeysPane::OpenAll()
{
    ChangeRows(
        [this]
        {
            m_outline.OpenAll();
            m_list->Reset();
        });
}

void KeysPane::CloseAll()
{
    ChangeRows(
        [this]
        {
            m_outline.CloseAll();
            m_list->Reset();
        });
}

wxVariant KeysPane::Cell(unsigned row, unsigned column) const
{
    OutlineRow const shown = m_outline.RowAt(row);
    if (column == KeyColumn)
        return OutlineCell(shown, comgui::ToWx(DisplayText(shown.name, NameLength)));
    comgui::Value const* const value = shown.key ? m_content.Find(*shown.key) : nullptr;
    if (!value)
        return wxString();
    return column == TypeColumn ? NameOfType(*value) : comgui::ToWx(DisplayTextOf(*value, ValueLength));
}

bool KeysPane::Look(unsigned row, unsigned, wxDataViewItemAttr& look) const
{
    OutlineRow const shown = m_outline.RowAt(row);
    double const glow = shown.key ? m_content.Glow(*shown.key, Clock::now()) : 0;
    if (glow > 0)
        look.SetBackgroundColour(ColourOf(Accent::Changed, glow));
    return glow > 0;
}

bool KeysPane::IsEditable(unsigned row, unsigned column) const
{
    return column == ValueColumn && ValueAt(row);
}

// Called only if the text is another than that which the edit began with.
void KeysPane::Edit(unsigned, unsigned, wxVariant const& value)
{
    comgui::Value const* const now = m_late ? m_late->Find(m_edited) : m_content.Find(m_edited);
    onEdit(m_edited, comgui::ToUtf8(value.GetString()), now && !(*now == m_begun) ? now : nullptr);
}

comgui::Value const* KeysPane::ValueAt(unsigned row) const
{
    auto const key = row < m_outline.RowCount() ? m_outline.RowAt(row).key : std::nullopt;
    return key ? m_content.Find(*key) : nullptr;
}

void KeysPane::Filter()
{
    std::string const text = comgui::ToUtf8(m_filter->GetValue());
    KeyOutline::Filter const isWanted = [this, text](std::string const& key)
    {
        comgui::Value const* const value = m_content.Find(key);
        return Contains(key, text) || (value && Contains(comgui::ToText(*value), text));
    };
    ChangeRows(
        [&]
        {
            m_outline.SetFilter(text.empty() ? KeyOutline::Filter() : isWanted);
            m_list->Reset();
        });
}

void KeysPane::Toggle(unsigned row)
{
    if (row >= m_outline.RowCount())
        return;
    ChangeRows(
        [this, row]
        {
            Replace(m_outline.Toggle(row));
            m_list->RowChanged(row);
        });
}

// As in every tree: to the right opens or goes down, to the left closes or goes up. Keys of the editor come
// by here first, and are its own.
void KeysPane::Move(wxKeyEvent& event)
{
    auto const row = m_list->Selected();
    bool const isRight = event.GetKeyCode() == WXK_RIGHT;
    if (m_list->IsEditing() || !row || *row >= m_outline.RowCount() || event.HasAnyModifiers() ||
        (!isRight && event.GetKeyCode() != WXK_LEFT))
        return event.Skip();
    OutlineRow const shown = m_outline.RowAt(*row);
    if (shown.isBranch && shown.isOpen != isRight)
        return Toggle(*row);
    if (isRight && shown.isBranch)
        m_list->SelectRow(*row + 1);
    else if (auto const parent = m_outline.ParentRow(*row); !isRight && parent)
        m_list->SelectRow(static_cast<unsigned>(*parent));
}

void KeysPane::StartFading()
{
    if (m_content.IsAnyFlashing() && !m_fading.IsRunning())
        m_fading.Start(FadingStep);
}

void KeysPane::Fade()
{
    m_content.Fading(Clock::now());
    m_list->RowsLookDifferent();
    if (!m_content.IsAnyFlashing())
        m_fading.Stop();
}

void KeysPane::Replace(OutlineChange const& change)
{
    m_list->RowsReplaced(change.row, change.removed, change.added);
}
}  // namespace desk
