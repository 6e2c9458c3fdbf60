#include "desk/view/ChartWindow.h"

#include <memory>
#include <wx/dcbuffer.h>
#include <wx/dcmemory.h>

namespace desk
{
ChartWindow::ChartWindow(wxWindow* parent, wxString const& name, wxSize least)
    : wxWindow(parent, wxID_ANY, wxDefaultPosition, wxDefaultSize, wxFULL_REPAINT_ON_RESIZE, name),
      m_isMirrored(parent->GetLayoutDirection() == wxLayout_RightToLeft)
{
    SetLayoutDirection(wxLayout_LeftToRight);  // else some systems mirror the drawing, letters included
    SetBackgroundStyle(wxBG_STYLE_PAINT);      // nothing is erased first, so nothing flickers
    SetMinSize(FromDIP(least));
    Bind(wxEVT_PAINT,
         [this](auto&)
         {
             wxAutoBufferedPaintDC dc(this);
             std::unique_ptr<wxGraphicsContext> const context(wxGraphicsContext::CreateFromUnknownDC(dc));
             if (context)
                 Paint(*context, GetClientSize(), ChartPalette::OfSystem(), HasFocus());
         });
    auto const repaint = [this](wxEvent& event)
    {
        Changed();
        event.Skip();
    };
    Bind(wxEVT_SET_FOCUS, repaint);
    Bind(wxEVT_KILL_FOCUS, repaint);
    Bind(wxEVT_SYS_COLOUR_CHANGED, repaint);
    Bind(wxEVT_LEFT_DOWN,
         [this](wxEvent& event)
         {
             SetFocus();
             event.Skip();
         });
}

void ChartWindow::SetMirrored(bool isMirrored)
{
    m_isMirrored = isMirrored;
    Changed();
}

double ChartWindow::Unit() const { return FromDIP(100) / 100.0; }

void ChartWindow::Changed() { Refresh(false); }

void ChartWindow::Paint(wxGraphicsContext& context, wxSize size, ChartPalette const& palette,
                        bool isFocused) const
{
    ChartPainter painter(context, size, palette, GetFont(), Unit(), m_isMirrored);
    Draw(painter);
    if (isFocused)
        painter.FocusRing();
}

wxBitmap ChartWindow::Picture(wxSize size, ChartPalette const& palette, bool isFocused) const
{
    wxBitmap picture;
    picture.Create(size, 24);
    wxMemoryDC dc(picture);
    std::unique_ptr<wxGraphicsContext> const context(wxGraphicsContext::Create(dc));
    if (context)
        Paint(*context, size, palette, isFocused);
    return picture;
}
}  // namespace desk
