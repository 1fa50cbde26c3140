// ZodEVICreate: the network quantities written into the drawing, the quantities dialog,
// a free estimate name, and the chosen lines handed to the metre module.
#include <cstdint>
#include <memory>
#include <vector>

#include "module/module_object.hpp"
#include "module/siblings.hpp"
#include "text/text.hpp"
#include "ui/quantities_dialog.hpp"
#include "velhost/ui.h"

namespace zodevi {

std::string ChooseEstimateName(const std::vector<std::string>& existing)
{
    std::string name = "Devis";
    int next = 2;
    for (std::size_t i = 0; i < existing.size();) {
        if (EqualsNoCase(name, existing[i])) {
            name = FormatString("Devis %d", next++);
            i = 0;
        } else {
            ++i;
        }
    }
    return name;
}

void CreateEstimateCommand()
{
    MainServices()->ShowInfo(
        "permet de créer un métré (devis, quantitatifs...etc) à partir des données des modules VRD");
    CommandSettingsScope settings(false);
    sibling::Rsx_WriteXDataMetres();

    std::unique_ptr<DlgMetExpArt> dialog;
    int answer = IDCANCEL;
    {
        ResourceOverride resources;
        CZodEVIDialogLinks links;
        links.resource = Resources().resource;
        links.projectsOfNetwork = [](std::string& network, std::vector<std::string>& projects) {
            return sibling::Rsx_GetRsxFromType(&network, &projects);
        };
        dialog = std::make_unique<DlgMetExpArt>(MainServices()->GetParentWindow(), CurrentBdr(), std::move(links));
        answer = dialog->DoModal();
    }
    if (answer != IDOK)
        return;
    std::vector<std::unique_ptr<CZodEVIAssocLine>> lines;
    if (dialog->CopySelectedLines(lines) <= 0)
        return;

    std::vector<std::string> existing;
    std::int32_t ignored = 0;
    sibling::VtMetre_ListeDesMetres(&existing, &ignored);
    std::vector<CZodEVIAssocLine*> handed;
    for (const auto& line : lines)
        handed.push_back(line.get());
    // The lines stay ours whatever the metre module answers; they go with `lines`.
    sibling::VtMetre_AfficherAssoc(ChooseEstimateName(existing), &handed, 1, 0);
}

} // namespace zodevi
