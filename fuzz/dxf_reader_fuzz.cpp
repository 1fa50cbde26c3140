// Fuzz target of the DXF reader: any input is refused with a message or read; a drawing
// that reads is walked as the module walks it, written back unchanged byte for byte,
// changed, written and read again.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "velhost/dbase.h"

namespace {

void Walk(AcDbDatabase& db, AcDbObjectId id, int depth)
{
    AcDbDictionary* dictionary = nullptr;
    if (depth > 64 || acdbOpenObject(dictionary, id, AcDb::kForRead) != Acad::eOk)
        return;
    VelRbPtr own(dictionary->xData());
    std::unique_ptr<AcDbDictionaryIterator> it(dictionary->newIterator());
    for (; !it->done(); it->next()) {
        AcDbObject* object = nullptr;
        if (it->getObject(object, AcDb::kForRead) == Acad::eOk) {
            VelRbPtr xdata(object->xData("DAZUVUVUD"));
            object->close();
        }
        Walk(db, it->objectId(), depth + 1);
    }
    dictionary->close();
}

[[noreturn]] void Fault(const char* what)
{
    std::fprintf(stderr, "%s\n", what);
    std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string input(reinterpret_cast<const char*>(data), size);
    std::unique_ptr<AcDbDatabase> db;
    if (const VelReadResult read = velReadDrawing(input, "fuzz.dxf", db); !read) {
        if (read.status != VelReadStatus::kMalformed || read.file != "fuzz.dxf" ||
            read.description().rfind("« fuzz.dxf »", 0) != 0)
            Fault("refus sans nom de fichier");
        return 0;
    }
    std::string error;
    Walk(*db, db->namedObjectsDictionaryId(), 0);
    db->layerNames();
    std::string out;
    if (!velWriteDrawing(*db, out, error))
        Fault("écriture refusée");
    if (out != input)
        Fault("réécriture différente du fichier lu");

    db->setOsmode(3);
    AcDbObjectId layer;
    db->addLayer("FUZZ", layer);
    AcDbDictionary* nod = nullptr;
    if (db->getNamedObjectsDictionary(nod, AcDb::kForWrite) == Acad::eOk) {
        auto* record = new AcDbXrecord;
        AcDbObjectId id;
        if (nod->setAt("FUZZ_NOUVEAU", record, id) != Acad::eOk)
            delete record;
        else
            record->close();
        VelRbBuilder list;
        list.add(velRbString(1001, "DAZUVUVUD")).add(velRbString(1000, "PRJ_NOM")).add(velRbReal(1040, 1.5));
        nod->setXData(list.head());
        nod->close();
    }
    if (!velWriteDrawing(*db, out, error))
        Fault("écriture après modification refusée");
    std::unique_ptr<AcDbDatabase> again;
    if (const VelReadResult read = velReadDrawing(out, "fuzz2.dxf", again); !read)
        Fault(("relecture refusée : " + read.description()).c_str());
    if (again->osmode() != 3)
        Fault("réglage perdu");
    return 0;
}
