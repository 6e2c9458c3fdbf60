// A drawing that tells numbers: takes the focus, and says in words, by GetLabel, what it shows. For the
// window's thread.
#pragma once

#include "desk/view/ChartPainter.h"
#include <wx/bitmap.h>
#include <wx/window.h>

namespace desk
{
class ChartWindow : public wxWindow
{
public:
    // name: for who reads the screen aloud, and for tests.
    ChartWindow(wxWindow* parent, wxString const& name, wxSize least);

    wxString GetLabel() const override = 0;

    // What the window shows at that size, whether it is visible or not.
    wxBitmap Picture(wxSize size, ChartPalette const& palette, bool isFocused = false) const;

    // The same, into the corner of something larger.
    void Paint(wxGraphicsContext& context, wxSize size, ChartPalette const& palette, bool isFocused) const;

    // Whether begin is on the right; as the parent says, unless changed.
    bool IsMirrored() const { return m_isMirrored; }
    void SetMirrored(bool isMirrored);

protected:
    virtual void Draw(ChartPainter& painter) const = 0;

    double Unit() const;
    void Changed();  // paints anew

private:
    bool m_isMirrored;
};
}  // namespace desk
