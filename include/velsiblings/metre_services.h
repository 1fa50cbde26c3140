// The metre module's contract, as the family calls it: its service name and file, and
// the six functions it exports under the service (strings by value, tables and lists by
// pointer, 0 for success). A caller finds a function by name and calls it through its
// type; the module declares its definitions through the same types.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "zodevi/article.h"
#include "zodevi/assoc_line.h"

inline constexpr const char* kVelMetreServicesName = "VelantoMetreServices r17.2";
inline constexpr const char* kVelMetreServicesModule = "VelMetre15.arx";

// Fills the table with the schedule file's articles, in file order; the caller owns them.
using VtMetre_RemplitTableauFn = std::int32_t(std::string file, std::vector<CZodEVIArticle*>* table, std::int32_t flag);
// Writes the table's articles to the schedule file.
using VtMetre_ExporterXmlFn = std::int32_t(std::string file, std::vector<CZodEVIArticle*>* table, std::int32_t flag);
// Opens the editor on the file (on the article of that tree path, or everywhere) and
// answers the changed articles with their change kinds; the caller owns the articles.
using VtMetre_EditerBordereauFn = std::int32_t(std::string file, std::vector<CZodEVIArticle*>* records,
                                               std::vector<std::uint32_t>* actions, std::string treePath);
// The names of the estimates already made.
using VtMetre_ListeDesMetresFn = std::int32_t(std::vector<std::string>* names, std::int32_t* out);
// Builds the estimate of that name from the lines; the lines stay the caller's.
using VtMetre_AfficherAssocFn = std::int32_t(std::string name, std::vector<CZodEVIAssocLine*>* lines, std::int32_t show,
                                             std::int32_t mode);
// The currency symbol of the prices.
using VtMetre_SymbMonetaireFn = std::int32_t(std::string* symbol);

// Change kinds VtMetre_EditerBordereau answers.
enum : std::uint32_t { kEditDeleted = 1, kEditModified = 2, kEditAdded = 3 };

// The exported functions, for the module that defines them.
#define VEL_METRE_EXPORT extern "C" __attribute__((visibility("default")))
VEL_METRE_EXPORT VtMetre_RemplitTableauFn VtMetre_RemplitTableau;
VEL_METRE_EXPORT VtMetre_ExporterXmlFn VtMetre_ExporterXml;
VEL_METRE_EXPORT VtMetre_EditerBordereauFn VtMetre_EditerBordereau;
VEL_METRE_EXPORT VtMetre_ListeDesMetresFn VtMetre_ListeDesMetres;
VEL_METRE_EXPORT VtMetre_AfficherAssocFn VtMetre_AfficherAssoc;
VEL_METRE_EXPORT VtMetre_SymbMonetaireFn VtMetre_SymbMonetaire;
