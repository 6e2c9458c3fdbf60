// A manager that several threads use in turn, for calls that need no session or bring their record with them.
#pragma once

#include "comgui/client/Manager.h"
#include <mutex>

namespace comgui::detail
{
class SharedManager
{
public:
    // Calls use with the manager, which is opened at first use.
    template <typename Use>
    auto With(Use const& use) -> Result<decltype(use(std::declval<ComGUIManager&>()))>
    {
        std::lock_guard const lock(m_lock);
        if (!m_manager)
        {
            auto opened = OpenManager();
            if (!opened)
                return opened.GetError();
            m_manager = *std::move(opened);
        }
        return use(*m_manager);
    }

private:
    std::mutex m_lock;
    std::unique_ptr<ComGUIManager> m_manager;
};
}  // namespace comgui::detail
