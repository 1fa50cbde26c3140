// The project quantity records that the road, platform, Korvane and network modules leave
// in a drawing: where they are filed, their XData layout, and the one reading of a record
// shared by every module that reads them (the network module writes them).
#pragma once

#include <algorithm>
#include <cmath>
#include <memory>
#include <cstddef>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "text/text.hpp"
#include "velhost/dbase.h"
#include "velhost/resbuf.h"

namespace velproj {

// XData application of a project record, and the marker that opens it.
inline constexpr const char* kRecordApp = "DAZUVUVUD";
inline constexpr const char* kNameMarker = "PRJ_NOM";

// Project kinds, as the estimate lines carry them (0 is the lump-sum pseudo-project).
inline constexpr int kKindPlatform = 1;
inline constexpr int kKindRoad = 2;
inline constexpr int kKindNetwork = 3;
inline constexpr int kKindKorvane = 4;

// Where one group of projects is filed: a dictionary of the named-object dictionary, and
// in it the dictionary holding one entry per project.
struct ProjectGroupPlace {
    int kind;
    const char* first;
    const char* second;
};

// The four groups, in the order in which they are read.
inline constexpr ProjectGroupPlace kProjectGroups[] = {
    {kKindNetwork, "VELANTO_RSX_VRD", "PROJECTS"},
    {kKindRoad, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ"},
    {kKindKorvane, "KORVANE", "KORVANE_PROJET"},
    {kKindPlatform, "VELANTO_PFM_VRD", "PROJECTS"},
};

// Quantities of one project by quantity key (compared exactly), in the order in which the
// keys first appear; a key met again replaces its quantity in place.
class QuantityTable {
public:
    void Set(const std::string& key, double quantity)
    {
        const auto [it, added] = index_.try_emplace(key, entries_.size());
        if (added)
            entries_.emplace_back(key, quantity);
        else
            entries_[it->second].second = quantity;
    }
    const double* Find(const std::string& key) const
    {
        const auto it = index_.find(key);
        return it == index_.end() ? nullptr : &entries_[it->second].second;
    }
    const std::vector<std::pair<std::string, double>>& Entries() const { return entries_; }
    std::size_t size() const { return entries_.size(); }
    bool empty() const { return entries_.empty(); }

private:
    std::vector<std::pair<std::string, double>> entries_;
    std::unordered_map<std::string, std::size_t> index_;
};

// The leading decimal number of a text ("12.5 m" is 12.5, "1,5" is 1, "abc" is 0),
// whatever the locale; never infinite or NaN.
inline double LeadingNumber(std::string_view text)
{
    std::size_t i = 0;
    const auto digits = [&] {
        const std::size_t from = i;
        while (i < text.size() && text[i] >= '0' && text[i] <= '9')
            ++i;
        return i - from;
    };
    while (i < text.size() && (text[i] == ' ' || text[i] == '\t'))
        ++i;
    const std::size_t start = i;
    if (i < text.size() && (text[i] == '+' || text[i] == '-'))
        ++i;
    std::size_t mantissa = digits();
    if (i < text.size() && text[i] == '.') {
        ++i;
        mantissa += digits();
    }
    if (mantissa == 0)
        return 0;
    std::size_t end = i;
    if (i < text.size() && (text[i] == 'e' || text[i] == 'E')) {
        ++i;
        if (i < text.size() && (text[i] == '+' || text[i] == '-'))
            ++i;
        if (digits() > 0)
            end = i;
    }
    std::string_view number = text.substr(start, end - start);
    if (!number.empty() && number.front() == '+')
        number.remove_prefix(1);
    const std::optional<double> value = ParseReal(number);
    return value && std::isfinite(*value) ? *value : 0;
}

// The quantity an XData item carries: a text (its leading number), a real, a 16-bit or a
// 32-bit integer. False for any other item, which ends the record.
inline bool QuantityOfItem(const resbuf* item, double& quantity)
{
    switch (item->restype) {
    case kXdAsciiString:
        quantity = LeadingNumber(item->resval.rstring ? item->resval.rstring : "");
        return true;
    case kXdReal:
        quantity = std::isfinite(item->resval.rreal) ? item->resval.rreal : 0;
        return true;
    case kXdInteger16:
        quantity = item->resval.rint;
        return true;
    case kXdInteger32:
        quantity = item->resval.rlong;
        return true;
    default:
        return false;
    }
}

// Reads one project record from the XData list of the application (its first item is the
// application name, not examined): the marker, exactly; the project's name; then pairs of
// a text key and its quantity. False when the head is malformed (nothing is read); a
// malformed pair ends the reading, keeping the pairs before it.
inline bool ReadProjectRecord(const resbuf* list, std::string& name, QuantityTable& quantities)
{
    const resbuf* item = list != nullptr ? list->rbnext : nullptr;
    if (item == nullptr || item->restype != kXdAsciiString || velRbText(item) != kNameMarker)
        return false;
    item = item->rbnext;
    if (item == nullptr || item->restype != kXdAsciiString)
        return false;
    name = velRbText(item);
    for (item = item->rbnext; item != nullptr && item->restype == kXdAsciiString; item = item->rbnext) {
        const resbuf* value = item->rbnext;
        double quantity = 0;
        if (value == nullptr || !QuantityOfItem(value, quantity))
            break;
        quantities.Set(velRbText(item), quantity);
        item = value;
    }
    return true;
}

// Walks the project records of a drawing, read only: the four groups in order, each
// group's entries in ascending byte order of their keys (the host's own sorted walk ignores
// case, which would make the record that wins a repeated name depend on the letters' case),
// and calls fn(kind, name, quantities) for each record that reads. Every failure is silent
// and only gives fewer records.
template <class Fn>
void ForEachProjectRecord(AcDbDatabase* database, Fn&& fn)
{
    struct Opened {
        AcDbObject* object = nullptr;
        ~Opened()
        {
            if (object != nullptr)
                object->close();
        }
    };
    const auto open = [](AcDbDictionary* parent, const char* key, Opened& holder) -> AcDbDictionary* {
        AcDbObject* object = nullptr;
        if (parent->getAt(key, object, AcDb::kForRead) != Acad::eOk || object == nullptr)
            return nullptr;
        holder.object = object;
        return dynamic_cast<AcDbDictionary*>(object);
    };
    AcDbDictionary* named = nullptr;
    if (database == nullptr || database->getNamedObjectsDictionary(named, AcDb::kForRead) != Acad::eOk ||
        named == nullptr)
        return;
    Opened namedHolder{named};
    for (const ProjectGroupPlace& place : kProjectGroups) {
        Opened firstHolder;
        AcDbDictionary* first = open(named, place.first, firstHolder);
        if (first == nullptr)
            continue;
        Opened secondHolder;
        AcDbDictionary* second = open(first, place.second, secondHolder);
        if (second == nullptr)
            continue;
        std::vector<std::pair<std::string, AcDbObjectId>> entries;
        {
            std::unique_ptr<AcDbDictionaryIterator> it(second->newIterator(AcRx::kDictCollated));
            for (; !it->done(); it->next())
                entries.emplace_back(it->name(), it->objectId());
        }
        std::stable_sort(entries.begin(), entries.end(),
                         [](const auto& a, const auto& b) { return a.first < b.first; });
        for (const auto& entry : entries) {
            AcDbObject* object = nullptr;
            if (acdbOpenObject(object, entry.second, AcDb::kForRead) != Acad::eOk || object == nullptr)
                continue;
            const VelRbPtr record(object->xData(kRecordApp));
            object->close();
            std::string name;
            QuantityTable quantities;
            if (record && ReadProjectRecord(record.get(), name, quantities))
                fn(place.kind, name, std::move(quantities));
        }
    }
}

} // namespace velproj
