// Entry point of the metre module and its six exported functions.
#include "velsiblings/metre_services.h"
#include "metre_services.hpp"
#include "schedule_editor.hpp"

#include "velhost/rx.h"

namespace {

// The service object the host files under the module's service name.
class CVelMetreService : public AcRxService {
public:
    const char* className() const override { return "CVelMetreService"; }
};

CVelMetreService* g_service = nullptr;

} // namespace

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    switch (message) {
    case AcRx::kInitAppMsg:
        acrxDynamicLinker()->unlockApplication(appId);
        acrxDynamicLinker()->registerAppMDIAware(appId);
        if (g_service == nullptr) {
            g_service = new CVelMetreService();
            acrxDynamicLinker()->registerService(kVelMetreServicesName, g_service);
        }
        break;
    case AcRx::kUnloadAppMsg:
        velUnregisterService(kVelMetreServicesName, g_service);
        delete g_service;
        g_service = nullptr;
        break;
    default:
        break;
    }
    return AcRx::kRetOK;
}

std::int32_t VtMetre_RemplitTableau(std::string file, std::vector<CZodEVIArticle*>* table, std::int32_t)
{
    return metre::FillArticles(file, table);
}

std::int32_t VtMetre_ExporterXml(std::string file, std::vector<CZodEVIArticle*>* table, std::int32_t)
{
    return metre::ExportArticles(file, table);
}

std::int32_t VtMetre_EditerBordereau(std::string file, std::vector<CZodEVIArticle*>* records,
                                     std::vector<std::uint32_t>* actions, std::string label)
{
    metre::RememberSchedulePath(file);
    return metre::EditScheduleFile(file, label, records, actions);
}

std::int32_t VtMetre_ListeDesMetres(std::vector<std::string>* names, std::int32_t*)
{
    return metre::ListEstimates(names);
}

std::int32_t VtMetre_AfficherAssoc(std::string name, std::vector<CZodEVIAssocLine*>* lines, std::int32_t, std::int32_t)
{
    return metre::ShowEstimate(name, lines);
}

std::int32_t VtMetre_SymbMonetaire(std::string* symbol)
{
    if (symbol == nullptr)
        return 2;
    *symbol = metre::CurrencySymbol();
    return 0;
}
