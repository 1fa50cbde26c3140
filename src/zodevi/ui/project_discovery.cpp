// Reading the project records of the drawing through the host's database, read only.
#include "ui/project_discovery.hpp"

#include <algorithm>
#include <memory>
#include <utility>
#include <vector>

#include "velhost/dbase.h"

namespace {

// Closes an object opened for read on every way out.
struct Opened {
    AcDbObject* object = nullptr;
    ~Opened()
    {
        if (object != nullptr)
            object->close();
    }
};

AcDbDictionary* OpenDictionary(AcDbDictionary* parent, const char* key, Opened& holder)
{
    AcDbObject* object = nullptr;
    if (parent->getAt(key, object, AcDb::kForRead) != Acad::eOk || object == nullptr)
        return nullptr;
    holder.object = object;
    return dynamic_cast<AcDbDictionary*>(object);
}

void ReadGroup(AcDbDictionary* projects, CZodEVIProjectMap& map)
{
    // The host sorts its iterator without regard to case; the records are walked in
    // byte order of their keys, so that which of two same-named records wins does not
    // depend on the letters' case.
    std::vector<std::pair<std::string, AcDbObjectId>> entries;
    {
        std::unique_ptr<AcDbDictionaryIterator> it(projects->newIterator(AcRx::kDictCollated));
        for (; !it->done(); it->next())
            entries.emplace_back(it->name(), it->objectId());
    }
    std::stable_sort(entries.begin(), entries.end(), [](const auto& a, const auto& b) { return a.first < b.first; });
    for (const auto& entry : entries) {
        AcDbObject* object = nullptr;
        if (acdbOpenObject(object, entry.second, AcDb::kForRead) != Acad::eOk || object == nullptr)
            continue;
        const VelRbPtr record(object->xData(velproj::kRecordApp));
        object->close();
        std::string name;
        velproj::QuantityTable quantities;
        if (record && velproj::ReadProjectRecord(record.get(), name, quantities))
            map.Get(name) = std::move(quantities);
    }
}

} // namespace

CZodEVIProjectMap* CZodEVIProjectMaps::OfKind(int kind) const
{
    switch (kind) {
    case velproj::kKindNetwork: return networks;
    case velproj::kKindRoad: return roadProjects;
    case velproj::kKindKorvane: return korvaneProjects;
    case velproj::kKindPlatform: return platforms;
    default: return nullptr;
    }
}

void DiscoverProjectsIn(AcDbDatabase* database, const CZodEVIProjectMaps& maps)
{
    AcDbDictionary* named = nullptr;
    if (database == nullptr || database->getNamedObjectsDictionary(named, AcDb::kForRead) != Acad::eOk ||
        named == nullptr)
        return;
    Opened namedHolder{named};
    for (const velproj::ProjectGroupPlace& place : velproj::kProjectGroups) {
        CZodEVIProjectMap* map = maps.OfKind(place.kind);
        if (map == nullptr)
            continue;
        Opened firstHolder;
        AcDbDictionary* first = OpenDictionary(named, place.first, firstHolder);
        if (first == nullptr)
            continue;
        Opened secondHolder;
        if (AcDbDictionary* second = OpenDictionary(first, place.second, secondHolder))
            ReadGroup(second, *map);
    }
}
