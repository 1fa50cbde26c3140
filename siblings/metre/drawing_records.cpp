// Reading the projects' quantity records with the reading shared by every module, and
// keeping the metre module's estimate records in an XRECORD dictionary of the drawing.
#include "drawing_records.hpp"

#include "text/text.hpp"
#include "velhost/dbase.h"
#include "velhost/resbuf.h"

namespace metre {

namespace {

// Closes an opened object on every way out.
struct Closer {
    AcDbObject* object = nullptr;
    ~Closer()
    {
        if (object != nullptr)
            object->close();
    }
};

resbuf* EstimateData(const EstimateRecord& record)
{
    VelRbBuilder builder;
    builder.add(velRbString(1, record.name));
    builder.add(velRbString(1, record.workbookPath));
    builder.add(velRbString(1, record.csvPath));
    builder.add(velRbLong(90, record.lineCount));
    builder.add(velRbReal(40, record.totalExclTax));
    builder.add(velRbReal(40, record.totalInclTax));
    return builder.release();
}

} // namespace

ProjectTables ProjectTables::Read(AcDbDatabase& database)
{
    ProjectTables tables;
    velproj::ForEachProjectRecord(&database, [&](int kind, const std::string& name, velproj::QuantityTable quantities) {
        tables.Add(kind, name, std::move(quantities));
    });
    return tables;
}

void ProjectTables::Add(int projectKind, const std::string& project, velproj::QuantityTable quantities)
{
    tables_[projectKind][project] = std::move(quantities);
}

bool ProjectTables::HasProject(int projectKind, const std::string& project) const
{
    const auto kind = tables_.find(projectKind);
    return kind != tables_.end() && kind->second.count(project) != 0;
}

std::optional<int> ProjectTables::KindHolding(int projectKind, const std::string& project) const
{
    if (HasProject(projectKind, project))
        return projectKind;
    for (int kind : {velproj::kKindPlatform, velproj::kKindRoad, velproj::kKindKorvane, velproj::kKindNetwork})
        if (HasProject(kind, project))
            return kind;
    return std::nullopt;
}

std::optional<double> ProjectTables::Quantity(int projectKind, const std::string& project, const std::string& key) const
{
    const auto kind = tables_.find(projectKind);
    if (kind == tables_.end())
        return std::nullopt;
    const auto found = kind->second.find(project);
    if (found == kind->second.end())
        return std::nullopt;
    std::optional<double> quantity;
    for (const auto& [entryKey, value] : found->second.Entries())
        if (EqualsNoCase(entryKey, key))
            quantity = value;
    return quantity;
}

bool RecordEstimate(AcDbDatabase& database, const EstimateRecord& record, std::string& error)
{
    const auto refused = [&](const char* what, Acad::ErrorStatus status) {
        error = FormatString("Le devis « %s » n'est pas enregistré dans le dessin : %s (%s).", record.name.c_str(),
                             what, acadErrorStatusText(status));
        return false;
    };
    AcDbDictionary* named = nullptr;
    Acad::ErrorStatus status = database.getNamedObjectsDictionary(named, AcDb::kForWrite);
    if (status != Acad::eOk)
        return refused("dictionnaire des objets nommés inaccessible", status);
    Closer namedCloser{named};
    AcDbObject* folderObject = nullptr;
    if (named->getAt(kEstimateDictionary, folderObject, AcDb::kForWrite) != Acad::eOk) {
        auto* created = new AcDbDictionary();
        AcDbObjectId id;
        status = named->setAt(kEstimateDictionary, created, id);
        if (status != Acad::eOk) {
            delete created;
            return refused("dictionnaire des devis impossible à créer", status);
        }
        folderObject = created;
    }
    Closer folderCloser{folderObject};
    auto* folder = dynamic_cast<AcDbDictionary*>(folderObject);
    if (folder == nullptr)
        return refused("l'entrée des devis n'est pas un dictionnaire", Acad::eNotThatKindOfClass);
    VelRbPtr data(EstimateData(record));
    AcDbObject* existing = nullptr;
    if (folder->getAt(record.name, existing, AcDb::kForWrite) == Acad::eOk) {
        Closer existingCloser{existing};
        auto* xrecord = dynamic_cast<AcDbXrecord*>(existing);
        if (xrecord == nullptr)
            return refused("une entrée du même nom n'est pas un devis", Acad::eNotThatKindOfClass);
        status = xrecord->setFromRbChain(data.get());
        return status == Acad::eOk || refused("données refusées", status);
    }
    auto* xrecord = new AcDbXrecord();
    AcDbObjectId id;
    status = folder->setAt(record.name, xrecord, id);
    if (status != Acad::eOk) {
        delete xrecord;
        return refused("nom refusé", status);
    }
    Closer recordCloser{xrecord};
    status = xrecord->setFromRbChain(data.get());
    return status == Acad::eOk || refused("données refusées", status);
}

std::vector<EstimateRecord> RecordedEstimates(AcDbDatabase& database)
{
    std::vector<EstimateRecord> records;
    AcDbDictionary* named = nullptr;
    if (database.getNamedObjectsDictionary(named, AcDb::kForRead) != Acad::eOk)
        return records;
    Closer namedCloser{named};
    AcDbObject* folderObject = nullptr;
    if (named->getAt(kEstimateDictionary, folderObject, AcDb::kForRead) != Acad::eOk)
        return records;
    Closer folderCloser{folderObject};
    auto* folder = dynamic_cast<AcDbDictionary*>(folderObject);
    if (folder == nullptr)
        return records;
    std::unique_ptr<AcDbDictionaryIterator> it(folder->newIterator(AcRx::kDictSorted));
    for (; !it->done(); it->next()) {
        AcDbObject* entry = nullptr;
        if (it->getObject(entry, AcDb::kForRead) != Acad::eOk)
            continue;
        Closer entryCloser{entry};
        auto* xrecord = dynamic_cast<AcDbXrecord*>(entry);
        if (xrecord == nullptr)
            continue;
        resbuf* raw = nullptr;
        xrecord->rbChain(raw);
        VelRbPtr data(raw);
        EstimateRecord record;
        record.name = it->name();
        int texts = 0, reals = 0;
        for (const resbuf* item = data.get(); item != nullptr; item = item->rbnext) {
            if (item->restype == 1) {
                std::string& target = texts == 0 ? record.name : texts == 1 ? record.workbookPath : record.csvPath;
                if (texts < 3)
                    target = velRbText(item);
                ++texts;
            } else if (item->restype == 90) {
                record.lineCount = item->resval.rlong;
            } else if (item->restype == 40) {
                (reals++ == 0 ? record.totalExclTax : record.totalInclTax) = item->resval.rreal;
            }
        }
        records.push_back(std::move(record));
    }
    return records;
}

} // namespace metre
