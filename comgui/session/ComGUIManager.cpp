#include "comgui/session/ComGUIManager.h"

#include "comgui/session/ComGUIGlobals.h"
#include <cstdio>
#include <cstdlib>
#include <new>

ComGUIManager* ComGUIManager::m_pInstance = nullptr;

ComGUIManager* ComGUIManager::GetInstance()
{
    if (!m_pInstance)
        m_pInstance = new ComGUIManager;
    return m_pInstance;
}

// From calloc, since a record that a caller puts in its place is freed the same way.
static TLogin* NewLoginRecord()
{
    auto* const login = static_cast<TLogin*>(std::calloc(1, sizeof(TLogin)));
    if (!login)
        throw std::bad_alloc();
    login->nSize = sizeof(TLogin);
    return login;
}

ComGUIManager::ComGUIManager() : m_pLogin(NewLoginRecord())
{
    __CFBundle* plugIn = nullptr;
    RegisterPlugIn(&plugIn);  // null after a failure, and that has no factories

    if (CreateComGUIModuleInterface(plugIn, &m_pModule) == 0)
    {
        m_interface = **m_pModule;
        if (m_interface.Open(&m_hModuleInstance) == 0)
        {
            hSTicketInstance = m_interface.STicketFactory;
            return;
        }
        // Nothing is released: these words are all that happens.
        std::fputs("@TODO: Bundle should be released here\n", stderr);
    }
    std::fputs("Could not get Interface pointer and Intialize the bundle\n", stderr);
}

ComGUIManager::~ComGUIManager()
{
    std::free(m_pLogin);
    m_pLogin = nullptr;
}

void ComGUIManager::FreeDll() {}
