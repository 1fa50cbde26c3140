// Finding the sibling modules: a service already registered is used as it is; otherwise
// the module file is searched on the host's support path, loaded, and checked.
#include "module/siblings.hpp"

#include "text/text.hpp"
#include "velsiblings/module_search.h"

namespace zodevi {

namespace {

// "x.arx" and "A.ARX" already carry the extension; ".arx" alone does not.
bool HasArxExtension(const std::string& name)
{
    if (CharCount(name) <= 4)
        return false;
    return EqualsNoCase(name.substr(name.size() - 4), ".arx");
}

AcRxDictionary* ServiceDictionary()
{
    return static_cast<AcRxDictionary*>(acrxSysRegistry()->at("ServiceDictionary"));
}

} // namespace

void* GetServiceSymbol(const char* moduleFile, const char* serviceName, const char* symbolName)
{
    if (symbolName == nullptr || *symbolName == '\0' || serviceName == nullptr || *serviceName == '\0')
        return nullptr;
    if (!acrxServiceIsRegistered(serviceName)) {
        if (moduleFile == nullptr || *moduleFile == '\0')
            return nullptr;
        const std::string file = moduleFile + std::string(HasArxExtension(moduleFile) ? "" : ".arx");
        // A module that does not come leaves the symbol unknown; the loader has said why.
        velLoadServiceModule(serviceName, VelModuleCandidates(file));
    }
    return acrxGetServiceSymbolAddr(serviceName, symbolName);
}

AcRxObject* GetServiceObject(const char* moduleFile, const char* serviceName)
{
    const std::string file = moduleFile ? moduleFile : "";
    const std::string service = serviceName ? serviceName : "";
    const VelServiceModule module = velLoadServiceModule(service.c_str(), VelModuleCandidates(file));
    switch (module.status) {
    case VelServiceModule::kNotFound:
        acrx_abort("Impossible de trouver le module <%s>!!!", file.c_str());
    case VelServiceModule::kNotLoaded:
        acrx_abort("Impossible de charger le module <%s>!!!", module.path.c_str());
    case VelServiceModule::kNoService:
        acrx_abort("Pas de service <%s>\nenregistré par le module <%s>!!!", service.c_str(), module.path.c_str());
    default:
        break;
    }
    return ServiceDictionary()->at(service.c_str());
}

CVelMainServices* MainServices()
{
    return static_cast<CVelMainServices*>(GetServiceObject(kVelMainServicesModule, kVelMainServicesName));
}

namespace sibling {

std::int32_t Rsx_WriteXDataMetres()
{
    return CallNetwork<Rsx_WriteXDataMetresFn>("Rsx_WriteXDataMetres");
}

std::int32_t Rsx_GetRsxFromType(std::string* networkName, std::vector<std::string>* projects)
{
    return CallNetwork<Rsx_GetRsxFromTypeFn>("Rsx_GetRsxFromType", networkName, projects);
}

std::int32_t VtMetre_ListeDesMetres(std::vector<std::string>* names, std::int32_t* out)
{
    return CallMetre<VtMetre_ListeDesMetresFn>("VtMetre_ListeDesMetres", names, out);
}

std::int32_t VtMetre_SymbMonetaire(std::string* symbol)
{
    return CallMetre<VtMetre_SymbMonetaireFn>("VtMetre_SymbMonetaire", symbol);
}

std::int32_t VtMetre_AfficherAssoc(const std::string& name, std::vector<CZodEVIAssocLine*>* lines, std::int32_t show,
                                   std::int32_t mode)
{
    return CallMetre<VtMetre_AfficherAssocFn>("VtMetre_AfficherAssoc", name, lines, show, mode);
}

} // namespace sibling

namespace {

class MetreServices final : public CZodEVIBdrMetre {
public:
    std::int32_t FillTable(const std::string& file, std::vector<CZodEVIArticle*>& table) override
    {
        return CallMetre<VtMetre_RemplitTableauFn>("VtMetre_RemplitTableau", file, &table, 1);
    }
    std::int32_t ExportTable(const std::string& file, std::vector<CZodEVIArticle*>& table) override
    {
        return CallMetre<VtMetre_ExporterXmlFn>("VtMetre_ExporterXml", file, &table, 1);
    }
    std::int32_t EditSchedule(const std::string& file, const std::string& treePath,
                              std::vector<CZodEVIArticle*>& records, std::vector<std::uint32_t>& actions) override
    {
        return CallMetre<VtMetre_EditerBordereauFn>("VtMetre_EditerBordereau", file, &records, &actions, treePath);
    }
    std::int32_t CurrencySymbol(std::string& symbol) override { return sibling::VtMetre_SymbMonetaire(&symbol); }
};

} // namespace

CZodEVIBdrMetre& MetreModule()
{
    static MetreServices metre;
    return metre;
}

} // namespace zodevi
