// The "Métré" page of the family's configuration dialog: which price-schedule file the
// module works with. A file is accepted only when it reads as a schedule; the choice is
// applied and remembered when the dialog confirms.
#pragma once

#include <string>

#include "velsiblings/config_services.h"

namespace zodevi {

class DlgChildCfgUser : public CVelConfigPage {
public:
    DlgChildCfgUser();
    bool Run() override;
    long OnMessage(unsigned message) override;

    // Asks for a file; keeps it when it can be read as a price schedule.
    void OnBrowse();
    // Makes the chosen file the current schedule's and remembers it, once it has read; a
    // file that does not read leaves the current schedule and its file as they were.
    void OnApply();

    std::string m_strPath;
};

inline constexpr const char* kCfgUnreadableSchedule = "ERREUR : impossible de lire le bordereau des prix !";

} // namespace zodevi
