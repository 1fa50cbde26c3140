// The network sizing module's contract, as the family calls it: its service name and
// file, and the two functions it exports under the service for the metre module.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

inline constexpr const char* kVelNetworkServicesName = "VelantoReseDimServices r17.2";
inline constexpr const char* kVelNetworkServicesModule = "VelReseDimVRD15.arx";

// Writes the networks' quantities into the drawing's project records: 0 written, 1 no
// drawing is open, 2 the drawing refused a change.
using Rsx_WriteXDataMetresFn = std::int32_t();
// The names of the projects of a network: 0 the list holds them, 1 none (or no drawing),
// 2 a null argument.
using Rsx_GetRsxFromTypeFn = std::int32_t(std::string* networkName, std::vector<std::string>* projects);

// The exported functions, for the module that defines them.
#define VEL_NETWORK_EXPORT extern "C" __attribute__((visibility("default")))
VEL_NETWORK_EXPORT Rsx_WriteXDataMetresFn Rsx_WriteXDataMetres;
VEL_NETWORK_EXPORT Rsx_GetRsxFromTypeFn Rsx_GetRsxFromType;
