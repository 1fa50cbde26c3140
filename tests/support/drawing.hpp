// Project records filed in a drawing as the sibling modules file them: an Xrecord under
// the named-object dictionary, in two levels of dictionaries, carrying the records' XData.
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "velhost/dbase.h"
#include "velsiblings/project_records.h"

// Files the record first/second/key; its XData is the records' application then `items`,
// which it takes over.
inline void FileProjectRecord(AcDbDatabase& db, const std::string& first, const std::string& second,
                              const std::string& key, const std::vector<resbuf*>& items)
{
    if (!db.isRegApp(velproj::kRecordApp))
        db.addRegApp(velproj::kRecordApp);
    const auto sub = [](AcDbDictionary* parent, const std::string& name) {
        AcDbObject* object = nullptr;
        if (parent->getAt(name, object, AcDb::kForWrite) == Acad::eOk)
            return static_cast<AcDbDictionary*>(object);
        auto created = std::make_unique<AcDbDictionary>();
        AcDbObjectId id;
        EXPECT_EQ(parent->setAt(name, created.get(), id), Acad::eOk);
        return created.release();
    };
    AcDbDictionary* named = nullptr;
    ASSERT_EQ(db.getNamedObjectsDictionary(named, AcDb::kForWrite), Acad::eOk);
    AcDbDictionary* level1 = sub(named, first);
    AcDbDictionary* level2 = sub(level1, second);
    auto record = std::make_unique<AcDbXrecord>();
    AcDbObjectId id;
    EXPECT_EQ(level2->setAt(key, record.get(), id), Acad::eOk);
    VelRbBuilder data;
    data.add(velRbString(kXdRegAppName, velproj::kRecordApp));
    for (resbuf* item : items)
        data.add(item);
    const VelRbPtr list(data.release());
    EXPECT_EQ(record->setXData(list.get()), Acad::eOk);
    record.release()->close();
    level2->close();
    level1->close();
    named->close();
}
