// The update and records commands, and the lookup of the metre module's functions as any
// sibling does it: by service name, loading the module file when the service is missing.
#include "network_commands.hpp"

#include "network_model.hpp"
#include "network_records.hpp"
#include "text/text.hpp"
#include "velhost/commands.h"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/rx.h"
#include "velsiblings/module_search.h"
#include "zodevi/api.h"

namespace network {

namespace {

AcDbDatabase* CurrentDrawing()
{
    AcDbDatabase* database = acdbHostApplicationServices()->workingDatabase();
    if (database == nullptr)
        acutPrintf("\nAucun dessin ouvert : ouvrez le dessin des réseaux d'abord.\n");
    return database;
}

void PrintWarnings(const std::vector<std::string>& warnings)
{
    for (const std::string& warning : warnings)
        acutPrintf("\nAttention : %s", warning.c_str());
    if (!warnings.empty())
        acutPrintf("\n");
}

void UpdateCommand()
{
    UpdateSchedule();
}

void RecordsCommand()
{
    WriteRecordsCommand();
}

} // namespace

void* FindZodEVIFunction(const char* symbol)
{
    velLoadServiceModule(kZodEVIServiceName, VelModuleCandidates(kZodEVIModuleFile));
    return acrxGetServiceSymbolAddr(kZodEVIServiceName, symbol);
}

bool UpdateSchedule()
{
    AcDbDatabase* database = CurrentDrawing();
    if (database == nullptr)
        return false;
    const NetworkDrawing drawing = NetworkDrawing::Read(*database);
    PrintWarnings(drawing.warnings);
    if (drawing.networks.empty()) {
        acutPrintf("\nAucun réseau dans le dessin (données %s) : bordereau inchangé.\n", kNetworkApp);
        return false;
    }
    auto* update = reinterpret_cast<ZodEVI_UpdateBdrRsxFn*>(FindZodEVIFunction("ZodEVI_UpdateBdrRsx"));
    auto* write = reinterpret_cast<ZodEVI_WriteBdrFn*>(FindZodEVIFunction("ZodEVI_WriteBdr"));
    if (update == nullptr || write == nullptr) {
        acutPrintf("\nModule de métré %s introuvable ou incomplet (fonction %s absente) : bordereau non mis à jour.\n",
                   kZodEVIModuleFile, update == nullptr ? "ZodEVI_UpdateBdrRsx" : "ZodEVI_WriteBdr");
        return false;
    }
    for (const Network& network : drawing.networks) {
        const std::int32_t index = network.index;
        const CZodEVIStringList models = network.Models(ElementKind::Pipe);
        const CZodEVIStringList pipeSupplies = network.Models(ElementKind::PipeSupply);
        const CZodEVIStringList fittings = network.Models(ElementKind::Fitting);
        const CZodEVIStringList fittingSupplies = network.Models(ElementKind::FittingSupply);
        const CZodEVIStringList ducts = network.Models(ElementKind::Duct);
        // Trench structures are not drawn by this module: no material names.
        const CZodEVIStringList materials;
        CZodEVIRealArray bounds;
        if (network.HasDepths())
            for (double bound : kDepthBounds)
                bounds.Add(bound);
        const std::int32_t status = update(&index, &network.name, &models, &pipeSupplies, &fittings, &fittingSupplies,
                                           &ducts, &materials, &bounds);
        const std::string what = FormatString("Réseau %s (indice %d) : %zu modèle(s) de canalisation, %zu de regard",
                                              network.name.c_str(), network.index, models.size(), fittings.size());
        if (status == kZodEVIOk)
            acutPrintf("\n%s : articles du bordereau ajoutés ou retirés.", what.c_str());
        else if (status == kZodEVIFailed)
            acutPrintf("\n%s : bordereau déjà à jour.", what.c_str());
        else
            acutPrintf("\n%s : mise à jour refusée (code %d).", what.c_str(), status);
    }
    const std::int32_t written = write();
    if (written != kZodEVIOk) {
        acutPrintf("\nLe bordereau n'a pas pu être enregistré (code %d).\n", written);
        return false;
    }
    acutPrintf("\nBordereau des prix enregistré.\n");
    return true;
}

bool WriteRecordsCommand()
{
    AcDbDatabase* database = CurrentDrawing();
    if (database == nullptr)
        return false;
    RecordReport report;
    std::vector<std::string> warnings;
    const int status = WriteNetworkQuantities(*database, report, warnings);
    PrintWarnings(warnings);
    for (const RecordReport::Written& w : report.written)
        acutPrintf("\nRéseau %s, projet « %s » : %s m de canalisations, %zu regard(s) ou accessoire(s), %zu "
                   "quantité(s) enregistrée(s).",
                   w.network.c_str(), w.project.c_str(), FormatReal(w.pipeLength, 2).c_str(), w.fittings, w.quantities);
    for (const std::string& removed : report.removed)
        acutPrintf("\nProjet « %s » retiré du métré : plus aucun élément dans le dessin.", removed.c_str());
    if (status != 0) {
        acutPrintf("\n%s\n", report.error.c_str());
        return false;
    }
    if (report.written.empty())
        acutPrintf("\nAucun réseau dans le dessin (données %s) : aucun métré à enregistrer.", kNetworkApp);
    acutPrintf("\n");
    return true;
}

bool AddCommands()
{
    AcEdCommandStack* stack = acedRegCmds();
    if (stack->addCommand(kCommandGroup, kUpdateGlobalName, kUpdateLocalName, ACRX_CMD::kModal, &UpdateCommand) !=
        Acad::eOk)
        return false;
    if (stack->addCommand(kCommandGroup, kRecordsGlobalName, kRecordsLocalName, ACRX_CMD::kModal, &RecordsCommand) !=
        Acad::eOk) {
        stack->removeGroup(kCommandGroup);
        return false;
    }
    return true;
}

void RemoveCommands()
{
    acedRegCmds()->removeGroup(kCommandGroup);
}

} // namespace network
