// Catalogue templates: the texts of a template for one network index, the template
// itself, and the array that holds the catalogue (owning) or a selection of it.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace zodevi {

// The texts of a template for one network index.
class CZodEVIArtParam {
public:
    std::string designation; // may hold placeholders filled by the generators
    std::string description;
    std::string categoryPattern; // network templates hold one "%s" for the network name
    std::string numberingPrefix; // "GC", "TP", a network prefix, or empty
};

// One template of the standard catalogue.
class CZodEVIArtTemplate {
public:
    CZodEVIArtTemplate() = default;
    CZodEVIArtTemplate(const CZodEVIArtTemplate& other);
    CZodEVIArtTemplate& operator=(const CZodEVIArtTemplate& other);

    // Kind and nature back to 2, pattern and unit emptied, every text removed.
    void Reset();
    // One text under index 0.
    void SetSingle(int kind, int nature, const std::string& codePattern, const std::string& unit,
                   const std::string& designation, const std::string& description, const std::string& categoryPattern,
                   const std::string& numberingPrefix);
    // The same texts under indices 0 to 12, each description after its network sentence.
    void SetPerNetwork(int kind, int nature, const std::string& codePattern, const std::string& unit,
                       const std::string& designation, const std::string& description,
                       const std::string& categoryPattern, const std::string& numberingPrefix);
    // Empty texts under indices 0 to 12, to be filled with SetTexts.
    void SetPerNetworkEmpty(int kind, int nature, const std::string& codePattern, const std::string& unit);
    // Creates the text of that index when missing, then sets it.
    void SetTexts(int index, const std::string& designation, const std::string& description,
                  const std::string& categoryPattern, const std::string& numberingPrefix);

    // The text with the lowest index; null when there is none. Meant for single templates.
    const CZodEVIArtParam* FirstTexts() const;
    // The text of a network index, or null when the template does not apply to it.
    const CZodEVIArtParam* TextsOf(int index) const;
    std::size_t TextCount() const { return texts.size(); }

    int kind = 2;
    int nature = 2;
    std::string codePattern;
    std::string unit;
    // Ordered by index, so that iteration is the same on every run.
    std::map<std::uint16_t, std::unique_ptr<CZodEVIArtParam>> texts;

private:
    void SetHead(int kind, int nature, const std::string& codePattern, const std::string& unit);
};

// Array of templates. An owning array deletes its elements when they leave it; a
// non-owning one (a selection) only forgets them.
class CZodEVIArtTemplateArray {
public:
    CZodEVIArtTemplateArray() = default;
    ~CZodEVIArtTemplateArray();
    CZodEVIArtTemplateArray(const CZodEVIArtTemplateArray&) = delete;
    CZodEVIArtTemplateArray& operator=(const CZodEVIArtTemplateArray&) = delete;

    void SetOwning(bool owning) { owning_ = owning; }
    bool IsOwning() const { return owning_; }

    int GetSize() const { return static_cast<int>(items_.size()); }
    CZodEVIArtTemplate* GetAt(int index) const;
    CZodEVIArtTemplate* operator[](int index) const { return GetAt(index); }

    // Keeps the first min(count, n) elements; owned elements past n are deleted, new
    // slots are null.
    void SetSize(int n);
    // Stores the template (or, with copy, a new deep copy of it) at index, growing the
    // array when index is past its end. An owned element already there is deleted.
    void InsertAt(int index, CZodEVIArtTemplate* tmpl, bool copy);
    void InsertCopyAt(int index, const CZodEVIArtTemplate& tmpl);
    // Empties out (without deleting), then appends every template of that kind in order.
    int SelectKind(int kind, CZodEVIArtTemplateArray& out) const;

private:
    std::vector<CZodEVIArtTemplate*> items_;
    bool owning_ = true;
};

} // namespace zodevi
