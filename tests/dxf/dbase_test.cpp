// Tests of the drawing database as modules use it: settings, layers, opening and
// closing objects, dictionaries and their sorted walk, XData of project records.
#include "velhost/dbase.h"

#include <gtest/gtest.h>

#include <map>

namespace {

std::unique_ptr<AcDbDatabase> OpenFixture(const char* name)
{
    std::unique_ptr<AcDbDatabase> db;
    EXPECT_EQ(velOpenDrawing(std::string(VEL_TEST_DATA) + "/dxf/" + name, db).description(), "");
    return db;
}

// A new drawing: version, layer 0, the named-object dictionary, and nothing of another.
TEST(AcDbDatabase, NewDrawingsShareNothing)
{
    std::string blank, error;
    {
        AcDbDatabase first;
        ASSERT_TRUE(velWriteDrawing(first, blank, error)) << error;
        AcDbObjectId layer;
        ASSERT_EQ(first.addLayer("PREMIER", layer), Acad::eOk);
        ASSERT_EQ(first.setOsmode(33), Acad::eOk);
        AcDbDictionary* nod = nullptr;
        ASSERT_EQ(first.getNamedObjectsDictionary(nod, AcDb::kForWrite), Acad::eOk);
        auto* record = new AcDbXrecord;
        AcDbObjectId id;
        ASSERT_EQ(nod->setAt("PREMIER", record, id), Acad::eOk);
        record->close();
        nod->close();
    }
    AcDbDatabase second;
    EXPECT_EQ(second.dxfVersion(), "AC1032");
    EXPECT_EQ(second.layerNames(), std::vector<std::string>{"0"});
    EXPECT_EQ(second.layerName(second.clayer()), "0");
    EXPECT_FALSE(second.namedObjectsDictionaryId().isNull());
    EXPECT_TRUE(second.isRegApp("acad"));
    EXPECT_FALSE(second.isModified());
    std::string text;
    ASSERT_TRUE(velWriteDrawing(second, text, error)) << error;
    EXPECT_EQ(text, blank);
}

TEST(AcDbDatabase, SettersCheckTheirValues)
{
    AcDbDatabase db;
    EXPECT_EQ(db.setAunits(5), Acad::eInvalidInput);
    EXPECT_EQ(db.setOsmode(-1), Acad::eInvalidInput);
    EXPECT_EQ(db.setOsmode(32768), Acad::eInvalidInput);
    AcCmColor color;
    EXPECT_EQ(color.setColorIndex(300), Acad::eInvalidInput);
    EXPECT_EQ(color.setColorIndex(1), Acad::eOk);
    EXPECT_EQ(db.setCecolor(color), Acad::eOk);
    EXPECT_EQ(db.cecolor().colorIndex(), 1);
    EXPECT_EQ(db.setAngbase(0.5), Acad::eOk);
    EXPECT_EQ(db.angbase(), 0.5);
    EXPECT_TRUE(db.isModified());
}

TEST(AcDbDatabase, CurrentLayerIsALayerOfTheDrawing)
{
    AcDbDatabase db;
    AcDbDatabase other;
    AcDbObjectId id;
    ASSERT_EQ(db.addLayer("VRD_EP", id), Acad::eOk);
    EXPECT_EQ(db.addLayer("vrd_ep", id), Acad::eDuplicateKey);
    EXPECT_EQ(db.addLayer("a/b", id), Acad::eInvalidInput);
    ASSERT_EQ(db.getLayerId("VRD_EP", id), Acad::eOk);
    EXPECT_EQ(db.setClayer(id), Acad::eOk);
    EXPECT_EQ(db.layerName(db.clayer()), "VRD_EP");
    EXPECT_EQ(db.setClayer(AcDbObjectId()), Acad::eNullObjectId);
    EXPECT_EQ(db.setClayer(other.clayer()), Acad::eInvalidInput);
    EXPECT_EQ(db.setClayer(db.namedObjectsDictionaryId()), Acad::eNotThatKindOfClass);
    AcDbLayerTableRecord* layer = nullptr;
    ASSERT_EQ(acdbOpenObject(layer, id, AcDb::kForRead), Acad::eOk);
    EXPECT_EQ(layer->name(), "VRD_EP");
    EXPECT_EQ(layer->color().colorIndex(), 7);
    layer->close();
}

TEST(AcDbObject, OpenModesFollowTheHostRules)
{
    AcDbDatabase db;
    const AcDbObjectId id = db.namedObjectsDictionaryId();
    AcDbObject* a = nullptr;
    AcDbObject* b = nullptr;
    ASSERT_EQ(db.openObject(a, id, AcDb::kForRead), Acad::eOk);
    ASSERT_EQ(db.openObject(b, id, AcDb::kForRead), Acad::eOk);
    EXPECT_EQ(db.openObject(b, id, AcDb::kForWrite), Acad::eWasOpenedForRead);
    EXPECT_FALSE(a->isWriteEnabled());
    EXPECT_EQ(static_cast<AcDbDictionary*>(a)->remove("ACAD_GROUP"), Acad::eNotOpenForWrite);
    a->close();
    a->close();
    ASSERT_EQ(db.openObject(a, id, AcDb::kForWrite), Acad::eOk);
    EXPECT_EQ(db.openObject(b, id, AcDb::kForRead), Acad::eWasOpenedForWrite);
    a->close();
    EXPECT_FALSE(a->isReadEnabled());
    AcDbXrecord* wrongKind = nullptr;
    EXPECT_EQ(acdbOpenObject(wrongKind, id, AcDb::kForRead), Acad::eNotThatKindOfClass);
    EXPECT_EQ(db.openObject(a, AcDbObjectId(&db, 0x7FFFFFFF), AcDb::kForRead), Acad::eUnknownHandle);
    EXPECT_EQ(db.openObject(a, AcDbObjectId(), AcDb::kForRead), Acad::eNullObjectId);
}

TEST(AcDbDictionary, KeysIgnoreCaseAndTheSortedWalkOrdersThem)
{
    AcDbDatabase db;
    AcDbDictionary* nod = nullptr;
    ASSERT_EQ(db.getNamedObjectsDictionary(nod, AcDb::kForWrite), Acad::eOk);
    AcDbObjectId id;
    for (const char* key : {"zèbre", "Alpha", "beta"})
        ASSERT_EQ(nod->setAt(key, new AcDbXrecord, id), Acad::eOk);
    auto* duplicate = new AcDbXrecord;
    EXPECT_EQ(nod->setAt("ALPHA", duplicate, id), Acad::eDuplicateKey);
    delete duplicate;
    auto* unnamed = new AcDbXrecord;
    EXPECT_EQ(nod->setAt("", unnamed, id), Acad::eInvalidKey);
    EXPECT_EQ(unnamed->database(), nullptr);
    delete unnamed;
    std::vector<std::string> sorted;
    std::unique_ptr<AcDbDictionaryIterator> it(nod->newIterator());
    for (; !it->done(); it->next())
        sorted.push_back(it->name());
    EXPECT_EQ(sorted, (std::vector<std::string>{"ACAD_GROUP", "ACAD_LAYOUT", "Alpha", "beta", "zèbre"}));
    std::vector<std::string> collated;
    it.reset(nod->newIterator(AcRx::kDictCollated));
    for (; !it->done(); it->next())
        collated.push_back(it->name());
    EXPECT_EQ(collated, (std::vector<std::string>{"ACAD_GROUP", "ACAD_LAYOUT", "zèbre", "Alpha", "beta"}));
    ASSERT_EQ(nod->getAt("BETA", id), Acad::eOk);
    std::string key;
    EXPECT_TRUE(nod->nameAt(id, key));
    EXPECT_EQ(key, "beta");
    EXPECT_EQ(nod->remove("Beta"), Acad::eOk);
    EXPECT_EQ(nod->getAt("beta", id), Acad::eKeyNotFound);
    EXPECT_EQ(nod->numEntries(), 4u);
    nod->close();
}

// Walks the project records the way the quantity take-off does.
std::map<std::string, std::map<std::string, double>> Projects(AcDbDatabase& db, const char* first, const char* second)
{
    std::map<std::string, std::map<std::string, double>> found;
    AcDbDictionary* nod = nullptr;
    if (db.getNamedObjectsDictionary(nod, AcDb::kForRead) != Acad::eOk)
        return found;
    AcDbObject* a = nullptr;
    if (nod->getAt(first, a, AcDb::kForRead) == Acad::eOk) {
        AcDbObject* b = nullptr;
        if (static_cast<AcDbDictionary*>(a)->getAt(second, b, AcDb::kForRead) == Acad::eOk) {
            std::unique_ptr<AcDbDictionaryIterator> it(static_cast<AcDbDictionary*>(b)->newIterator());
            for (; !it->done(); it->next()) {
                AcDbObject* record = nullptr;
                if (it->getObject(record, AcDb::kForRead) != Acad::eOk)
                    continue;
                VelRbPtr xd(record->xData("DAZUVUVUD"));
                record->close();
                const resbuf* rb = xd ? xd->rbnext : nullptr;
                if (!rb || velRbText(rb) != "PRJ_NOM" || !rb->rbnext)
                    continue;
                auto& table = found[velRbText(rb->rbnext)];
                for (rb = rb->rbnext->rbnext; rb && rb->restype == 1000 && rb->rbnext; rb = rb->rbnext->rbnext) {
                    const resbuf* q = rb->rbnext;
                    table[velRbText(rb)] = q->restype == 1040 || q->restype == 1041 ? q->resval.rreal
                                           : q->restype == 1070                     ? q->resval.rint
                                           : q->restype == 1071                     ? q->resval.rlong
                                                                                    : std::stod(velRbText(q));
                }
            }
            b->close();
        }
        a->close();
    }
    nod->close();
    return found;
}

TEST(AcDbDictionary, ProjectRecordsReadFromEveryVersion)
{
    for (const char* file : {"r2000.dxf", "r2004_1252.dxf", "r2018.dxf", "crlf.dxf", "r2018_bin.dxf"}) {
        SCOPED_TRACE(file);
        auto db = OpenFixture(file);
        const auto networks = Projects(*db, "VELANTO_RSX_VRD", "PROJECTS");
        ASSERT_EQ(networks.size(), 2u);
        EXPECT_EQ(networks.at("Réseau EU").at("EU_LIN"), 12.5);
        EXPECT_EQ(networks.at("Réseau EU").at("EU_NB"), 12.0);
        EXPECT_EQ(networks.at("Réseau EP").at("EP_LIN"), 12.5);
        EXPECT_EQ(networks.at("Réseau EP").at("EP_BIG"), 100000.0);
        EXPECT_EQ(Projects(*db, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ").at("Route 1").at("CHAUSSEE"), 250.0);
        EXPECT_TRUE(Projects(*db, "KORVANE", "KORVANE_PROJET").empty());
    }
}

TEST(AcDbXrecord, LongStringsOfAnXrecordWithoutCloningFlag)
{
    auto db = OpenFixture("r2018.dxf");
    AcDbDictionary* nod = nullptr;
    ASSERT_EQ(db->getNamedObjectsDictionary(nod, AcDb::kForRead), Acad::eOk);
    AcDbObject* object = nullptr;
    ASSERT_EQ(nod->getAt("SANS_DRAPEAU", object, AcDb::kForRead), Acad::eOk);
    auto* record = dynamic_cast<AcDbXrecord*>(object);
    ASSERT_NE(record, nullptr);
    resbuf* chain = nullptr;
    ASSERT_EQ(record->rbChain(chain), Acad::eOk);
    VelRbPtr owned(chain);
    ASSERT_TRUE(chain);
    EXPECT_EQ(chain->restype, 1);
    EXPECT_EQ(velRbText(chain).size(), 3000u);
    ASSERT_TRUE(chain->rbnext);
    EXPECT_EQ(chain->rbnext->resval.rpoint[2], 3.0);
    object->close();
    nod->close();
}

TEST(AcDbObject, SetXDataNeedsWriteAccessAndAWellFormedList)
{
    AcDbDatabase db;
    AcDbDictionary* nod = nullptr;
    ASSERT_EQ(db.getNamedObjectsDictionary(nod, AcDb::kForRead), Acad::eOk);
    VelRbBuilder list;
    list.add(velRbString(1001, "DAZUVUVUD")).add(velRbString(1000, "PRJ_NOM"));
    EXPECT_EQ(nod->setXData(list.head()), Acad::eNotOpenForWrite);
    nod->close();
    ASSERT_EQ(db.getNamedObjectsDictionary(nod, AcDb::kForWrite), Acad::eOk);
    VelRbPtr bad(velRbString(1000, "sans application"));
    EXPECT_EQ(nod->setXData(bad.get()), Acad::eInvalidInput);
    EXPECT_FALSE(db.isRegApp("DAZUVUVUD"));
    EXPECT_EQ(nod->setXData(list.head()), Acad::eOk);
    EXPECT_TRUE(db.isRegApp("DAZUVUVUD"));
    EXPECT_EQ(nod->xDataApplications(), std::vector<std::string>{"DAZUVUVUD"});
    VelRbPtr none(velRbString(1001, "DAZUVUVUD"));
    EXPECT_EQ(nod->setXData(none.get()), Acad::eOk);
    EXPECT_EQ(nod->xData("DAZUVUVUD"), nullptr);
    nod->close();
}

TEST(AcDbXrecord, DataRoundTripsThroughTheDrawing)
{
    AcDbDatabase db;
    AcDbDictionary* nod = nullptr;
    ASSERT_EQ(db.getNamedObjectsDictionary(nod, AcDb::kForWrite), Acad::eOk);
    auto* record = new AcDbXrecord;
    VelRbBuilder data;
    data.add(velRbString(1, "métré")).add(velRbPoint(10, 1, 2, 3)).add(velRbReal(40, 0.25)).add(velRbLong(90, -9));
    ASSERT_EQ(record->setFromRbChain(data.head()), Acad::eOk);
    VelRbPtr forbidden(velRbString(1000, "x"));
    EXPECT_EQ(record->setFromRbChain(forbidden.get()), Acad::eInvalidInput);
    AcDbObjectId id;
    ASSERT_EQ(nod->setAt("DONNEES", record, id), Acad::eOk);
    record->close();
    nod->close();
    std::string text;
    std::string error;
    ASSERT_TRUE(velWriteDrawing(db, text, error)) << error;
    std::unique_ptr<AcDbDatabase> back;
    ASSERT_EQ(velReadDrawing(text, "neuf.dxf", back).description(), "");
    AcDbXrecord* again = nullptr;
    ASSERT_EQ(acdbOpenObject(again, back->idFromHandle(id.handle()), AcDb::kForRead), Acad::eOk);
    resbuf* chain = nullptr;
    ASSERT_EQ(again->rbChain(chain), Acad::eOk);
    VelRbPtr owned(chain);
    EXPECT_EQ(velRbText(chain), "métré");
    EXPECT_EQ(chain->rbnext->resval.rpoint[2], 3.0);
    EXPECT_EQ(chain->rbnext->rbnext->resval.rreal, 0.25);
    EXPECT_EQ(chain->rbnext->rbnext->rbnext->resval.rlong, -9);
    EXPECT_EQ(again->ownerId().handle(), back->namedObjectsDictionaryId().handle());
    again->close();
}

} // namespace
