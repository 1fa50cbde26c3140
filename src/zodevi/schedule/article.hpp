// The article record of the price schedule and the text conventions every other part
// uses to build and recognise articles: nature levels, categories, tree paths, quantity
// keys, group keys and codes.
#pragma once

#include "zodevi/article.h"

#include <array>
#include <optional>
#include <string>
#include <string_view>

namespace zodevi {

class CZodEVIArtParam;

// Article natures.
enum : int {
    kNaturePoint = 1,
    kNatureLinear = 2,
    kNatureSurface = 3,
    kNatureVolume = 4,
    kNatureText = 5,
    kNatureNonGraphic = 6,
};

// The two-backslash separator between levels of categories and tree paths.
inline constexpr std::string_view kTreeSeparator = "\\\\";

// Special group keys.
inline constexpr std::string_view kNoGroupKey = "0";
inline constexpr std::string_view kGeneralNetworkName = "RSX_GENERAL";

// "\\Ponctuel" ... "\\Non Graphique"; empty for a nature outside 1 to 6.
std::string MakeNatureLevel(int nature);

// The description sentence put before the texts of a network index ("Article associé
// aux réseaux EP.\r\n"); empty for 12 and above.
std::string NetworkSentence(int networkIndex);

// Category pattern filled with the network name, then the nature level.
std::string MakeCategory(const CZodEVIArtParam& texts, int nature, std::string_view networkName);
// Category pattern as it stands, then the nature level.
std::string MakeCategory(const CZodEVIArtParam& texts, int nature);

// "<category with nature level>\\<code> - <designation>".
std::string MakeTreePath(std::string_view category, std::string_view code, std::string_view designation);

// The quantity name between double quotes.
std::string MakeQuantityKey(std::string_view quantityName);

// "PRJ_RES(<name>)".
std::string MakeNetworkGroupKey(std::string_view networkName);
// "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()".
std::string MakeRoadGroupKey();

// The network name of a key holding "PRJ_RES(": the text between that prefix and the
// key's last ")" after it; nullopt when the key names no network. Every place that takes
// a network name out of a key uses this one rule, so that names holding parentheses
// ("EU (tranche 2)") survive.
std::optional<std::string> NetworkNameOfKey(std::string_view groupKey);

// True when the key holds PRJ_PFM(), PRJ_RTE() or PRJ_PCV().
bool IsRoadGroupKey(std::string_view groupKey);

// True when the key ties the article to a network or a road project.
bool IsAssociatedKey(std::string_view groupKey);

// The category of an article taken from its tree path, without its nature level;
// nullopt when the article has none.
std::optional<std::string> DeriveCategory(const CZodEVIArticle& article);

// The category with its nature level: the tree path cut before the separator that
// precedes the code-and-designation part; nullopt without a backslash.
std::optional<std::string> CategoryWithNatureLevel(std::string_view treePath);

} // namespace zodevi
