// The text rules for natures, categories, tree paths, quantity keys and group keys.
#include "schedule/article.hpp"

#include "schedule/art_template.hpp"
#include "text/text.hpp"

namespace zodevi {

namespace {

constexpr std::string_view kNetworkPrefix = "PRJ_RES(";

} // namespace

std::string MakeNatureLevel(int nature)
{
    switch (nature) {
    case kNaturePoint:
        return "\\\\Ponctuel";
    case kNatureLinear:
        return "\\\\Linéaire";
    case kNatureSurface:
        return "\\\\Surfacique";
    case kNatureVolume:
        return "\\\\Volumique";
    case kNatureText:
        return "\\\\Textuel";
    case kNatureNonGraphic:
        return "\\\\Non Graphique";
    default:
        return {};
    }
}

std::string NetworkSentence(int networkIndex)
{
    static const char* const sentences[] = {
        "Article associé aux réseaux EP.\r\n",          "Article associé aux réseaux EU.\r\n",
        "Article associé aux réseaux AEP.\r\n",         "Article associé aux réseaux GAZ.\r\n",
        "Article associé aux réseaux BTA.\r\n",         "Article associé aux réseaux BTB.\r\n",
        "Article associé aux réseaux HTA.\r\n",         "Article associé aux réseaux HTB.\r\n",
        "Article associé aux réseaux 'Téléphone'.\r\n", "Article associé aux réseaux 'Télévision'.\r\n",
        "Article associé aux réseaux 'Eclairage'.\r\n", "Article associé aux réseaux 'Chauffage'.\r\n",
    };
    if (networkIndex < 0 || networkIndex >= static_cast<int>(std::size(sentences)))
        return {};
    return sentences[networkIndex];
}

std::string MakeCategory(const CZodEVIArtParam& texts, int nature, std::string_view networkName)
{
    return FormatPattern(texts.categoryPattern, {std::string(networkName)}) + MakeNatureLevel(nature);
}

std::string MakeCategory(const CZodEVIArtParam& texts, int nature)
{
    return texts.categoryPattern + MakeNatureLevel(nature);
}

std::string MakeTreePath(std::string_view category, std::string_view code, std::string_view designation)
{
    std::string path(category);
    path += kTreeSeparator;
    path += code;
    path += " - ";
    path += designation;
    return path;
}

std::string MakeQuantityKey(std::string_view quantityName)
{
    std::string key = "\"";
    key += quantityName;
    key += '"';
    return key;
}

std::string MakeNetworkGroupKey(std::string_view networkName)
{
    std::string key(kNetworkPrefix);
    key += networkName;
    key += ')';
    return key;
}

std::string MakeRoadGroupKey()
{
    return "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()";
}

std::optional<std::string> NetworkNameOfKey(std::string_view groupKey)
{
    const auto start = groupKey.find(kNetworkPrefix);
    if (start == std::string_view::npos)
        return std::nullopt;
    const auto nameStart = start + kNetworkPrefix.size();
    const auto close = groupKey.rfind(')');
    if (close == std::string_view::npos || close < nameStart)
        return std::nullopt;
    return std::string(groupKey.substr(nameStart, close - nameStart));
}

bool IsRoadGroupKey(std::string_view groupKey)
{
    return groupKey.find("PRJ_PFM()") != std::string_view::npos ||
           groupKey.find("PRJ_RTE()") != std::string_view::npos || groupKey.find("PRJ_PCV()") != std::string_view::npos;
}

bool IsAssociatedKey(std::string_view groupKey)
{
    for (std::string_view marker : {"PRJ_RES(", "PRJ_RTE(", "PRJ_PCV(", "PRJ_PFM("})
        if (groupKey.find(marker) != std::string_view::npos)
            return true;
    return false;
}

std::optional<std::string> CategoryWithNatureLevel(std::string_view treePath)
{
    const auto last = treePath.rfind('\\');
    if (last == std::string_view::npos)
        return std::nullopt;
    // Drop the separator (the backslash before the last one as well) with what follows.
    return std::string(treePath.substr(0, last == 0 ? 0 : last - 1));
}

std::optional<std::string> DeriveCategory(const CZodEVIArticle& article)
{
    std::optional<std::string> category = CategoryWithNatureLevel(article.treePath);
    if (!category)
        return std::nullopt;
    // Every nature with a level is cut at it, so that volume and text articles added
    // by hand find a model like the others; an unknown nature keeps the whole text.
    const std::string level = MakeNatureLevel(article.nature);
    if (!level.empty()) {
        const auto at = category->find(level);
        if (at != std::string::npos)
            category->resize(at);
    }
    if (category->empty())
        return std::nullopt;
    return category;
}

} // namespace zodevi
