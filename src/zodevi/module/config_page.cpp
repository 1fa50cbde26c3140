// The configuration page of the price-schedule file, on the host's command line.
#include "module/config_page.hpp"

#include <filesystem>

#include "common/parameters.hpp"
#include "module/module_object.hpp"
#include "module/siblings.hpp"
#include "schedule/schedule_exchange.hpp"
#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/ui.h"
#include "zodevi/api.h"

namespace zodevi {

DlgChildCfgUser::DlgChildCfgUser()
{
    if (CurrentBdr() != nullptr)
        m_strPath = CurrentBdr()->path;
}

bool DlgChildCfgUser::Run()
{
    for (;;) {
        acutPrintf("\nBordereau des prix : %s", m_strPath.c_str());
        acedInitGet(0, "Parcourir Terminer _ Browse Done");
        std::string choice;
        const int status = acedGetKword("\nPage Métré [Parcourir/Terminer] <Terminer> : ", choice);
        if (status == RTNONE || (status == RTNORM && choice == "Done"))
            return true;
        if (status != RTNORM)
            return false;
        OnBrowse();
    }
}

long DlgChildCfgUser::OnMessage(unsigned message)
{
    if (message == kVelConfigApply)
        OnApply();
    return 0;
}

void DlgChildCfgUser::OnBrowse()
{
    std::string chosen;
    if (acedGetString(true, "\nFichier de bordereau des prix (*.xml) : ", chosen) != RTNORM || chosen.empty())
        return;
    std::error_code error;
    if (!std::filesystem::is_regular_file(chosen, error)) {
        acutPrintf("\n%s : ce fichier n'existe pas.", chosen.c_str());
        return;
    }
    // A file dialog answers full paths; the parameter file must not depend on the
    // folder the host was started from.
    chosen = std::filesystem::absolute(chosen, error).lexically_normal().string();
    if (EqualsNoCase(chosen, m_strPath))
        return;
    // A file the schedule reader rejects cannot be chosen; the current schedule is not
    // touched by the trial.
    CZodEVIBdr trial;
    trial.path = chosen;
    if (Read(trial))
        m_strPath = chosen;
    else
        MessageBoxFlags(&velUI(), MB_ICONWARNING | MB_OK, "%s", kCfgUnreadableSchedule);
}

void DlgChildCfgUser::OnApply()
{
    CZodEVIBdr* bdr = CurrentBdr();
    if (bdr == nullptr)
        return;
    // Read beside the current schedule first: a file that changed or vanished since it
    // was picked must not leave the user with an empty schedule bound to it.
    if (!ReadFrom(*bdr, m_strPath)) {
        MessageBoxFlags(&velUI(), MB_ICONWARNING | MB_OK, "%s", kCfgUnreadableSchedule);
        m_strPath = bdr->path;
        return;
    }
    WriteParameter(MainServices()->GetParameterFile().c_str(), kBdrParameterSection, kBdrParameterKey,
                   m_strPath.c_str());
}

} // namespace zodevi

ZODEVI_EXPORT void Vel_ZodEVI_CfgUser(CVelConfigPage** page, void* /*parent*/)
{
    if (page == nullptr)
        return;
    zodevi::ResourceOverride resources;
    *page = new zodevi::DlgChildCfgUser();
}
