// Field table of the article record and the text rules for natures, categories, tree
// paths, quantity keys and group keys.
#include "schedule/article.hpp"

#include "schedule/art_template.hpp"
#include "text/text.hpp"

namespace {

using T = CZodEVIArticleField::Type;
using A = CZodEVIArticle;

constexpr CZodEVIArticleField Text(const char* name, std::string A::*m) { return {name, T::Text, m, nullptr, nullptr}; }
constexpr CZodEVIArticleField Real(const char* name, double A::*m) { return {name, T::Real, nullptr, m, nullptr}; }
constexpr CZodEVIArticleField Int(const char* name, int A::*m) { return {name, T::Int, nullptr, nullptr, m}; }

constexpr std::string_view kNetworkPrefix = "PRJ_RES(";

} // namespace

const std::array<CZodEVIArticleField, 48>& ArticleFields()
{
    static const std::array<CZodEVIArticleField, 48> fields = {
        Text("code", &A::code),             Real("unitPrice", &A::unitPrice),
        Real("metreReal1", &A::metreReal1), Real("taxRate", &A::taxRate),
        Real("metreReal2", &A::metreReal2), Text("metreText1", &A::metreText1),
        Int("number", &A::number),          Int("metreInt1", &A::metreInt1),
        Text("metreText2", &A::metreText2), Int("nature", &A::nature),
        Text("designation", &A::designation), Text("metreText3", &A::metreText3),
        Text("unit", &A::unit),             Text("quantityKey", &A::quantityKey),
        Text("description", &A::description), Int("metreInt2", &A::metreInt2),
        Int("metreInt3", &A::metreInt3),    Text("metreText4", &A::metreText4),
        Int("metreInt4", &A::metreInt4),    Text("groupKey", &A::groupKey),
        Int("metreInt5", &A::metreInt5),    Int("metreInt6", &A::metreInt6),
        Int("metreInt7", &A::metreInt7),    Text("metreText5", &A::metreText5),
        Int("metreInt8", &A::metreInt8),    Real("metreReal3", &A::metreReal3),
        Real("metreReal4", &A::metreReal4), Int("metreInt9", &A::metreInt9),
        Text("metreText6", &A::metreText6), Int("metreInt10", &A::metreInt10),
        Text("metreText7", &A::metreText7), Int("metreInt11", &A::metreInt11),
        Text("metreText8", &A::metreText8), Text("metreText9", &A::metreText9),
        Real("metreReal5", &A::metreReal5), Int("metreInt12", &A::metreInt12),
        Text("metreText10", &A::metreText10), Text("metreText11", &A::metreText11),
        Real("metreReal6", &A::metreReal6), Real("metreReal7", &A::metreReal7),
        Real("metreReal8", &A::metreReal8), Int("metreInt13", &A::metreInt13),
        Text("metreText12", &A::metreText12), Int("metreInt14", &A::metreInt14),
        Real("metreReal9", &A::metreReal9), Real("metreReal10", &A::metreReal10),
        Real("metreReal11", &A::metreReal11), Text("treePath", &A::treePath),
    };
    return fields;
}

std::string MakeNatureLevel(int nature)
{
    switch (nature) {
    case kNaturePoint: return "\\\\Ponctuel";
    case kNatureLinear: return "\\\\Linéaire";
    case kNatureSurface: return "\\\\Surfacique";
    case kNatureVolume: return "\\\\Volumique";
    case kNatureText: return "\\\\Textuel";
    case kNatureNonGraphic: return "\\\\Non Graphique";
    default: return {};
    }
}

std::string NetworkSentence(int networkIndex)
{
    static const char* const sentences[] = {
        "Article associé aux réseaux EP.\r\n",
        "Article associé aux réseaux EU.\r\n",
        "Article associé aux réseaux AEP.\r\n",
        "Article associé aux réseaux GAZ.\r\n",
        "Article associé aux réseaux BTA.\r\n",
        "Article associé aux réseaux BTB.\r\n",
        "Article associé aux réseaux HTA.\r\n",
        "Article associé aux réseaux HTB.\r\n",
        "Article associé aux réseaux 'Téléphone'.\r\n",
        "Article associé aux réseaux 'Télévision'.\r\n",
        "Article associé aux réseaux 'Eclairage'.\r\n",
        "Article associé aux réseaux 'Chauffage'.\r\n",
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
           groupKey.find("PRJ_RTE()") != std::string_view::npos ||
           groupKey.find("PRJ_PCV()") != std::string_view::npos;
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
