// Display and purge commands of the price schedule.
#include "module/schedule_commands.hpp"

#include "common/parameters.hpp"
#include "module/module_object.hpp"
#include "module/siblings.hpp"
#include "schedule/schedule_exchange.hpp"
#include "velhost/editor.h"

namespace zodevi {

void DisplayScheduleCommand()
{
    MainServices()->ShowInfo("affiche le bordereau des prix");
    CommandSettingsScope settings(false);
    // The editor works on the file: what was changed in memory since the last write is
    // not shown, as the callers of the service functions expect.
    if (CurrentBdr() != nullptr)
        Edit(*CurrentBdr(), "");
}

void PurgeScheduleCommand()
{
    MainServices()->ShowInfo("purge le bordereau des prix (=> enlève les articles obsolètes)");
    CommandSettingsScope settings(false);
    acutPrintf("%s", "\nAttention !!! Purger rallonge les temps de traitement !");
    bool purge = GetPurgeFlag();
    if (AskYesNo("Purger à la prochaine mise à jour", true, GetPurgeFlag(), purge))
        SetPurgeFlag(purge);
}

} // namespace zodevi
