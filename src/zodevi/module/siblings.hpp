// The four sibling modules: where they are, how their services and exported functions
// are reached (loading a module on demand), the service objects' operations, and the
// forwarders to the metre and network sizing functions.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "schedule/metre_link.hpp"
#include "velhost/rx.h"
#include "velsiblings/config_services.h"
#include "velsiblings/main_services.h"
#include "velsiblings/metre_services.h"
#include "velsiblings/network_services.h"
#include "zodevi/assoc_line.h"

namespace zodevi {

// Address of the function the service exports under symbolName, loading the module file
// first when the service is not registered; null when anything is missing. Silent.
void* GetServiceSymbol(const char* moduleFile, const char* serviceName, const char* symbolName);

// The object registered under serviceName, loading the module file first when needed.
// Never answers null: a module that cannot be found, loaded or that registers no such
// service ends the host (acrx_abort).
AcRxObject* GetServiceObject(const char* moduleFile, const char* serviceName);

// The main services module's service object (the host ends when the module is missing).
CVelMainServices* MainServices();

// Calls the function a sibling exports under symbol, as a function of type Fn; answers
// 1 without calling when the function cannot be found, else the function's answer.
template <class Fn, class... Args>
std::int32_t CallSiblingFunction(const char* moduleFile, const char* serviceName, const char* symbol, Args&&... args)
{
    void* address = GetServiceSymbol(moduleFile, serviceName, symbol);
    if (address == nullptr)
        return 1;
    return reinterpret_cast<Fn*>(address)(std::forward<Args>(args)...);
}

template <class Fn, class... Args>
std::int32_t CallMetre(const char* symbol, Args&&... args)
{
    return CallSiblingFunction<Fn>(kVelMetreServicesModule, kVelMetreServicesName, symbol, std::forward<Args>(args)...);
}

template <class Fn, class... Args>
std::int32_t CallNetwork(const char* symbol, Args&&... args)
{
    return CallSiblingFunction<Fn>(kVelNetworkServicesModule, kVelNetworkServicesName, symbol,
                                   std::forward<Args>(args)...);
}

// Forwarders of the functions above (1 when missing). In a namespace of their own, so
// that a sibling may include this header and define the exported functions themselves.
namespace sibling {
std::int32_t Rsx_WriteXDataMetres();
std::int32_t Rsx_GetRsxFromType(std::string* networkName, std::vector<std::string>* projects);
std::int32_t VtMetre_ListeDesMetres(std::vector<std::string>* names, std::int32_t* out);
std::int32_t VtMetre_SymbMonetaire(std::string* symbol);
std::int32_t VtMetre_AfficherAssoc(const std::string& name, std::vector<CZodEVIAssocLine*>* lines, std::int32_t show,
                                   std::int32_t mode);
} // namespace sibling

// The metre module as the schedule takes it: its exported functions, reached through its
// service (loading the module on demand), 1 when missing.
CZodEVIBdrMetre& MetreModule();

} // namespace zodevi
