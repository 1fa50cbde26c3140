// The functions the metre module exports under its service "VelantoMetreServices r17.2":
// strings by value, tables and lists by pointer, 0 for success.
#pragma once

#include "zodevi/article.h"
#include "zodevi/assoc_line.h"

#include <cstdint>
#include <string>
#include <vector>

#define VEL_METRE_EXPORT extern "C" __attribute__((visibility("default")))

inline constexpr const char* kMetreServiceName = "VelantoMetreServices r17.2";

VEL_METRE_EXPORT std::int32_t VtMetre_RemplitTableau(std::string file, std::vector<CZodEVIArticle*>* table,
                                                     std::int32_t flag);
VEL_METRE_EXPORT std::int32_t VtMetre_ExporterXml(std::string file, std::vector<CZodEVIArticle*>* table,
                                                  std::int32_t flag);
VEL_METRE_EXPORT std::int32_t VtMetre_EditerBordereau(std::string file, std::vector<CZodEVIArticle*>* records,
                                                      std::vector<std::uint32_t>* actions, std::string label);
VEL_METRE_EXPORT std::int32_t VtMetre_ListeDesMetres(std::vector<std::string>* names, std::int32_t* out);
VEL_METRE_EXPORT std::int32_t VtMetre_AfficherAssoc(std::string name, std::vector<CZodEVIAssocLine*>* lines,
                                                    std::int32_t show, std::int32_t mode);
VEL_METRE_EXPORT std::int32_t VtMetre_SymbMonetaire(std::string* symbol);
