// The article record exchanged between the module and its siblings (the metre module
// fills, reads and returns these records directly), with a table of its 48 fields.
#pragma once

#include <array>
#include <string>

// One priced line of the schedule. The field order is the record's exchange order with
// the metre module; the metreXxx fields belong to that module and are only carried.
class CZodEVIArticle {
public:
    std::string code;
    double unitPrice = 0;
    double metreReal1 = 0;
    double taxRate = 19.6;
    double metreReal2 = 1.0;
    std::string metreText1;
    int number = -1;
    int metreInt1 = 0;
    std::string metreText2;
    int nature = 2;
    std::string designation;
    std::string metreText3;
    std::string unit;
    std::string quantityKey;
    std::string description;
    int metreInt2 = 0;
    int metreInt3 = 0;
    std::string metreText4;
    int metreInt4 = 0;
    std::string groupKey;
    int metreInt5 = 0;
    int metreInt6 = 7;
    int metreInt7 = 0;
    std::string metreText5;
    int metreInt8 = 0;
    double metreReal3 = 0;
    double metreReal4 = 0;
    int metreInt9 = 0;
    std::string metreText6;
    int metreInt10 = 0;
    std::string metreText7;
    int metreInt11 = 7;
    std::string metreText8;
    std::string metreText9;
    double metreReal5 = 0;
    int metreInt12 = 7;
    std::string metreText10;
    std::string metreText11;
    double metreReal6 = 1.0;
    double metreReal7 = 0;
    double metreReal8 = 1.0;
    int metreInt13 = 0;
    std::string metreText12;
    int metreInt14 = 0;
    double metreReal9 = 1.0;
    double metreReal10 = 1.0;
    double metreReal11 = 0;
    std::string treePath;
};

// Describes one field of the record by name, so that readers and writers walk all 48
// fields in their order without naming each one.
struct CZodEVIArticleField {
    enum class Type { Text, Real, Int };
    const char* name;
    Type type;
    std::string CZodEVIArticle::*text;
    double CZodEVIArticle::*real;
    int CZodEVIArticle::*integer;
};

namespace zodevi_fields {

using T = CZodEVIArticleField::Type;
using A = CZodEVIArticle;

constexpr CZodEVIArticleField Text(const char* name, std::string A::*m)
{
    return {name, T::Text, m, nullptr, nullptr};
}
constexpr CZodEVIArticleField Real(const char* name, double A::*m)
{
    return {name, T::Real, nullptr, m, nullptr};
}
constexpr CZodEVIArticleField Int(const char* name, int A::*m)
{
    return {name, T::Int, nullptr, nullptr, m};
}

} // namespace zodevi_fields

inline const std::array<CZodEVIArticleField, 48>& ArticleFields()
{
    using namespace zodevi_fields;
    static const std::array<CZodEVIArticleField, 48> fields = {
        Text("code", &A::code),
        Real("unitPrice", &A::unitPrice),
        Real("metreReal1", &A::metreReal1),
        Real("taxRate", &A::taxRate),
        Real("metreReal2", &A::metreReal2),
        Text("metreText1", &A::metreText1),
        Int("number", &A::number),
        Int("metreInt1", &A::metreInt1),
        Text("metreText2", &A::metreText2),
        Int("nature", &A::nature),
        Text("designation", &A::designation),
        Text("metreText3", &A::metreText3),
        Text("unit", &A::unit),
        Text("quantityKey", &A::quantityKey),
        Text("description", &A::description),
        Int("metreInt2", &A::metreInt2),
        Int("metreInt3", &A::metreInt3),
        Text("metreText4", &A::metreText4),
        Int("metreInt4", &A::metreInt4),
        Text("groupKey", &A::groupKey),
        Int("metreInt5", &A::metreInt5),
        Int("metreInt6", &A::metreInt6),
        Int("metreInt7", &A::metreInt7),
        Text("metreText5", &A::metreText5),
        Int("metreInt8", &A::metreInt8),
        Real("metreReal3", &A::metreReal3),
        Real("metreReal4", &A::metreReal4),
        Int("metreInt9", &A::metreInt9),
        Text("metreText6", &A::metreText6),
        Int("metreInt10", &A::metreInt10),
        Text("metreText7", &A::metreText7),
        Int("metreInt11", &A::metreInt11),
        Text("metreText8", &A::metreText8),
        Text("metreText9", &A::metreText9),
        Real("metreReal5", &A::metreReal5),
        Int("metreInt12", &A::metreInt12),
        Text("metreText10", &A::metreText10),
        Text("metreText11", &A::metreText11),
        Real("metreReal6", &A::metreReal6),
        Real("metreReal7", &A::metreReal7),
        Real("metreReal8", &A::metreReal8),
        Int("metreInt13", &A::metreInt13),
        Text("metreText12", &A::metreText12),
        Int("metreInt14", &A::metreInt14),
        Real("metreReal9", &A::metreReal9),
        Real("metreReal10", &A::metreReal10),
        Real("metreReal11", &A::metreReal11),
        Text("treePath", &A::treePath),
    };
    return fields;
}
