// Catalogue templates and template arrays.
#include "schedule/art_template.hpp"

#include "schedule/article.hpp"

namespace zodevi {

namespace {
constexpr int kNetworkIndexCount = 13;
}

CZodEVIArtTemplate::CZodEVIArtTemplate(const CZodEVIArtTemplate& other)
{
    *this = other;
}

CZodEVIArtTemplate& CZodEVIArtTemplate::operator=(const CZodEVIArtTemplate& other)
{
    if (this == &other)
        return *this;
    Reset();
    kind = other.kind;
    nature = other.nature;
    codePattern = other.codePattern;
    unit = other.unit;
    for (const auto& [index, param] : other.texts)
        texts.emplace(index, std::make_unique<CZodEVIArtParam>(*param));
    return *this;
}

void CZodEVIArtTemplate::Reset()
{
    kind = 2;
    nature = 2;
    codePattern.clear();
    unit.clear();
    texts.clear();
}

void CZodEVIArtTemplate::SetHead(int newKind, int newNature, const std::string& newCodePattern,
                                 const std::string& newUnit)
{
    Reset();
    kind = newKind;
    nature = newNature;
    codePattern = newCodePattern;
    unit = newUnit;
}

void CZodEVIArtTemplate::SetSingle(int newKind, int newNature, const std::string& newCodePattern,
                                   const std::string& newUnit, const std::string& designation,
                                   const std::string& description, const std::string& categoryPattern,
                                   const std::string& numberingPrefix)
{
    SetHead(newKind, newNature, newCodePattern, newUnit);
    SetTexts(0, designation, description, categoryPattern, numberingPrefix);
}

void CZodEVIArtTemplate::SetPerNetwork(int newKind, int newNature, const std::string& newCodePattern,
                                       const std::string& newUnit, const std::string& designation,
                                       const std::string& description, const std::string& categoryPattern,
                                       const std::string& numberingPrefix)
{
    SetHead(newKind, newNature, newCodePattern, newUnit);
    for (int index = 0; index < kNetworkIndexCount; ++index)
        SetTexts(index, designation, NetworkSentence(index) + description, categoryPattern, numberingPrefix);
}

void CZodEVIArtTemplate::SetPerNetworkEmpty(int newKind, int newNature, const std::string& newCodePattern,
                                            const std::string& newUnit)
{
    SetHead(newKind, newNature, newCodePattern, newUnit);
    for (int index = 0; index < kNetworkIndexCount; ++index)
        SetTexts(index, {}, {}, {}, {});
}

void CZodEVIArtTemplate::SetTexts(int index, const std::string& designation, const std::string& description,
                                  const std::string& categoryPattern, const std::string& numberingPrefix)
{
    auto& slot = texts[static_cast<std::uint16_t>(index)];
    if (!slot)
        slot = std::make_unique<CZodEVIArtParam>();
    slot->designation = designation;
    slot->description = description;
    slot->categoryPattern = categoryPattern;
    slot->numberingPrefix = numberingPrefix;
}

const CZodEVIArtParam* CZodEVIArtTemplate::FirstTexts() const
{
    return texts.empty() ? nullptr : texts.begin()->second.get();
}

const CZodEVIArtParam* CZodEVIArtTemplate::TextsOf(int index) const
{
    if (index < 0 || index > 0xFFFF)
        return nullptr;
    const auto found = texts.find(static_cast<std::uint16_t>(index));
    return found == texts.end() ? nullptr : found->second.get();
}

CZodEVIArtTemplateArray::~CZodEVIArtTemplateArray()
{
    SetSize(0);
}

CZodEVIArtTemplate* CZodEVIArtTemplateArray::GetAt(int index) const
{
    if (index < 0 || index >= GetSize())
        return nullptr;
    return items_[static_cast<std::size_t>(index)];
}

void CZodEVIArtTemplateArray::SetSize(int n)
{
    if (n < 0)
        n = 0;
    const auto size = static_cast<std::size_t>(n);
    if (owning_)
        for (std::size_t i = size; i < items_.size(); ++i)
            delete items_[i];
    items_.resize(size, nullptr);
}

void CZodEVIArtTemplateArray::InsertAt(int index, CZodEVIArtTemplate* tmpl, bool copy)
{
    if (index < 0)
        return;
    if (index >= GetSize())
        items_.resize(static_cast<std::size_t>(index) + 1, nullptr);
    auto& slot = items_[static_cast<std::size_t>(index)];
    CZodEVIArtTemplate* incoming = (copy && tmpl != nullptr) ? new CZodEVIArtTemplate(*tmpl) : tmpl;
    if (owning_ && slot != nullptr && slot != incoming)
        delete slot;
    slot = incoming;
}

void CZodEVIArtTemplateArray::InsertCopyAt(int index, const CZodEVIArtTemplate& tmpl)
{
    InsertAt(index, const_cast<CZodEVIArtTemplate*>(&tmpl), true);
}

int CZodEVIArtTemplateArray::SelectKind(int kind, CZodEVIArtTemplateArray& out) const
{
    out.SetSize(0);
    for (CZodEVIArtTemplate* tmpl : items_)
        if (tmpl != nullptr && tmpl->kind == kind)
            out.items_.push_back(tmpl);
    return out.GetSize();
}

} // namespace zodevi
