// Drawing database of the stand-in host: header settings, layers, the named-object
// dictionary and its objects with XData, and the DXF files a drawing is opened from and
// saved to. Objects are owned by their database; callers open them, then close them.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "velhost/header_vars.h"
#include "velhost/read_result.h"
#include "velhost/resbuf.h"

namespace Acad {
// Outcome of a database operation.
enum ErrorStatus {
    eOk = 0,
    eNotImplementedYet,
    eInvalidInput,
    eNullObjectId,
    eNullObjectPointer,
    eKeyNotFound,
    eDuplicateKey,
    eInvalidKey,
    eUnknownHandle,
    eNotThatKindOfClass,
    eWasOpenedForRead,
    eWasOpenedForWrite,
    eNotOpenForWrite,
    eNotOpenForRead,
    eAlreadyInDb,
    eBadDxfSequence,
    eRegappIdNotFound,
    eNotApplicable,
};
} // namespace Acad

// Human-readable name of a status ("eKeyNotFound").
const char* acadErrorStatusText(Acad::ErrorStatus status);

namespace AcDb {
// How an object is opened.
enum OpenMode { kForRead = 0, kForWrite = 1, kForNotify = 2 };
} // namespace AcDb

namespace AcRx {
// Order of a dictionary iterator.
enum DictIterType { kDictCollated = 0, kDictSorted = 1 };
} // namespace AcRx

class AcDbDatabase;
class AcDbObject;

// 64-bit object handle, written in DXF as hexadecimal.
using AcDbHandle = std::uint64_t;

// Identifies one object of one database; null when default-built.
class AcDbObjectId {
public:
    AcDbObjectId() = default;
    AcDbObjectId(AcDbDatabase* database, AcDbHandle handle) : database_(database), handle_(handle) {}
    bool isNull() const { return database_ == nullptr || handle_ == 0; }
    AcDbHandle handle() const { return handle_; }
    AcDbDatabase* database() const { return database_; }
    friend bool operator==(const AcDbObjectId&, const AcDbObjectId&) = default;
    friend auto operator<=>(const AcDbObjectId&, const AcDbObjectId&) = default;

    static const AcDbObjectId kNull;

private:
    AcDbDatabase* database_ = nullptr;
    AcDbHandle handle_ = 0;
};

// The host's colour value: an index colour (1-255), BYBLOCK (0) or BYLAYER (256).
class AcCmColor {
public:
    static constexpr short kByBlock = 0;
    static constexpr short kByLayer = 256;
    short colorIndex() const { return index_; }
    Acad::ErrorStatus setColorIndex(short index);
    bool isByLayer() const { return index_ == kByLayer; }
    bool isByBlock() const { return index_ == kByBlock; }
    friend bool operator==(const AcCmColor&, const AcCmColor&) = default;

private:
    short index_ = kByLayer;
};

namespace vel::dxf {
struct ObjectBody;
class DrawingFile;
} // namespace vel::dxf

// Any object of the drawing: an entity, a table record, a dictionary, an XRECORD or an
// object the host does not model (kept as it was read).
class AcDbObject {
public:
    AcDbObject();
    virtual ~AcDbObject();
    AcDbObject(const AcDbObject&) = delete;
    AcDbObject& operator=(const AcDbObject&) = delete;

    // DXF type name of the object ("DICTIONARY", "XRECORD", "LINE", ...).
    const std::string& dxfName() const;
    AcDbObjectId objectId() const;
    AcDbObjectId ownerId() const;
    AcDbDatabase* database() const;

    bool isReadEnabled() const;
    bool isWriteEnabled() const;
    // Ends an open; an object opened n times for read needs n closes.
    Acad::ErrorStatus close();

    // XData of one application (every application when name is null or empty) as a new
    // list starting with its 1001 item; null when there is none. Free with acutRelRb.
    resbuf* xData(const char* regappName = nullptr) const;
    // Replaces the XData of every application the list names (each 1001 item starts one);
    // an application followed by nothing loses its XData. Needs the object open for write.
    // A malformed list (no leading 1001, unbalanced braces, unknown code) changes nothing.
    Acad::ErrorStatus setXData(const resbuf* xdata);
    // Names of the applications that have XData on the object, in file order.
    std::vector<std::string> xDataApplications() const;

    // The object's tags, for the host's own database functions.
    vel::dxf::ObjectBody& body() { return *body_; }
    const vel::dxf::ObjectBody& body() const { return *body_; }

protected:
    explicit AcDbObject(const char* dxfName);
    Acad::ErrorStatus assertWriteEnabled() const;
    Acad::ErrorStatus assertReadEnabled() const;
    // Files a new object in this object's database, owned by this object; it stays open
    // for write.
    Acad::ErrorStatus addToDatabase(AcDbObject* newObject);
    // Notes that the database changed.
    void noteChange();

private:
    friend class AcDbDatabase;
    std::unique_ptr<vel::dxf::ObjectBody> own_; // until the object joins a drawing
    vel::dxf::ObjectBody* body_ = nullptr;      // own_, or the drawing's
    AcDbDatabase* database_ = nullptr;
    int readers_ = 0;
    bool writer_ = false;
};

class AcDbDictionaryIterator;

// Maps names to objects. Keys compare without regard to case, as the host's do; entries
// keep the order of the file, the sorted iterator orders them by key.
class AcDbDictionary : public AcDbObject {
public:
    AcDbDictionary();

    std::uint32_t numEntries() const;
    bool has(const std::string& key) const;
    Acad::ErrorStatus getAt(const std::string& key, AcDbObjectId& id) const;
    Acad::ErrorStatus getAt(const std::string& key, AcDbObject*& object, AcDb::OpenMode mode) const;
    // Adds a new entry (the object becomes the database's, owned by this dictionary) or,
    // for an existing key, answers eDuplicateKey. Needs the dictionary open for write.
    Acad::ErrorStatus setAt(const std::string& key, AcDbObject* newValue, AcDbObjectId& id);
    // Removes an entry (the object stays in the drawing, without owner).
    Acad::ErrorStatus remove(const std::string& key);
    // Key of an entry's object; false when the object is not in the dictionary.
    bool nameAt(AcDbObjectId id, std::string& key) const;
    // New iterator over a snapshot of the entries; delete it when done.
    AcDbDictionaryIterator* newIterator(AcRx::DictIterType type = AcRx::kDictSorted) const;
};

// Walks a dictionary's entries: `for (it = d->newIterator(); !it->done(); it->next())`.
class AcDbDictionaryIterator {
public:
    struct Entry {
        std::string key;
        AcDbObjectId id;
    };
    explicit AcDbDictionaryIterator(std::vector<Entry> entries) : entries_(std::move(entries)) {}
    bool done() const { return pos_ >= entries_.size(); }
    // Moves on; answers whether an entry remains.
    bool next();
    const std::string& name() const;
    AcDbObjectId objectId() const;
    Acad::ErrorStatus getObject(AcDbObject*& object, AcDb::OpenMode mode) const;

private:
    std::vector<Entry> entries_;
    std::size_t pos_ = 0;
};

// An object holding a list of typed data, as a program files it in a dictionary.
class AcDbXrecord : public AcDbObject {
public:
    AcDbXrecord();
    // The data as a new list (null when empty); free with acutRelRb.
    Acad::ErrorStatus rbChain(resbuf*& list) const;
    // Replaces the data; restype is the DXF group code of each item (1 text, 10 point,
    // 40 real, 70 16-bit, 90 32-bit, 330/340/350/360 handles as hexadecimal text ...).
    Acad::ErrorStatus setFromRbChain(const resbuf* list);
};

// A layer of the layer table.
class AcDbLayerTableRecord : public AcDbObject {
public:
    AcDbLayerTableRecord();
    std::string name() const;
    AcCmColor color() const;
};

// One drawing. The default constructor makes a new empty drawing (layer "0" current, an
// empty named-object dictionary); velOpenDrawing fills one from a DXF file.
class AcDbDatabase {
public:
    AcDbDatabase();
    ~AcDbDatabase();
    AcDbDatabase(const AcDbDatabase&) = delete;
    AcDbDatabase& operator=(const AcDbDatabase&) = delete;

    // Header settings: all of them as velhost/header_vars.h names them, then one by one.
    // setHeaderSettings sets them all or, when one leaves its range (eInvalidInput) or the
    // current layer names no layer of the drawing (eKeyNotFound), none.
    const VelHeaderSettings& headerSettings() const;
    Acad::ErrorStatus setHeaderSettings(const VelHeaderSettings& settings);
    short aunits() const;
    Acad::ErrorStatus setAunits(short value);
    double angbase() const;
    Acad::ErrorStatus setAngbase(double value);
    bool angdir() const;
    Acad::ErrorStatus setAngdir(bool value);
    int osmode() const;
    Acad::ErrorStatus setOsmode(int value);
    AcCmColor cecolor() const;
    Acad::ErrorStatus setCecolor(const AcCmColor& value);
    bool attdia() const;
    Acad::ErrorStatus setAttdia(bool value);
    bool attreq() const;
    Acad::ErrorStatus setAttreq(bool value);
    bool limcheck() const;
    Acad::ErrorStatus setLimcheck(bool value);
    bool orthomode() const;
    Acad::ErrorStatus setOrthomode(bool value);
    // The current layer; setClayer takes the id of a layer of this drawing.
    AcDbObjectId clayer() const;
    Acad::ErrorStatus setClayer(AcDbObjectId layerId);

    // Layers.
    Acad::ErrorStatus getLayerId(const std::string& name, AcDbObjectId& id) const;
    std::string layerName(AcDbObjectId layerId) const;
    std::vector<std::string> layerNames() const;
    // Adds a layer (colour 7, continuous) or answers eDuplicateKey.
    Acad::ErrorStatus addLayer(const std::string& name, AcDbObjectId& id);

    // Named-object dictionary.
    AcDbObjectId namedObjectsDictionaryId() const;
    Acad::ErrorStatus getNamedObjectsDictionary(AcDbDictionary*& dictionary, AcDb::OpenMode mode);

    // Any object by id or handle.
    Acad::ErrorStatus openObject(AcDbObject*& object, AcDbObjectId id, AcDb::OpenMode mode);
    AcDbObjectId idFromHandle(AcDbHandle handle) const;

    // Applications registered in the APPID table.
    bool isRegApp(const std::string& name) const;
    Acad::ErrorStatus addRegApp(const std::string& name);

    // DXF version ("AC1032"), the file opened from or last saved to ("" for a new
    // drawing), and whether anything changed since.
    std::string dxfVersion() const;
    const std::string& fileName() const;
    bool isModified() const;
    // Number of objects, entities and table records included.
    std::size_t objectCount() const;

    // A drawing read from a file (see velOpenDrawing); `fileName` as fileName() gives it.
    AcDbDatabase(std::unique_ptr<vel::dxf::DrawingFile> file, std::string fileName);
    // The drawing's DXF form, for the host's own functions.
    vel::dxf::DrawingFile& file() { return *file_; }
    const vel::dxf::DrawingFile& file() const { return *file_; }

private:
    friend class AcDbObject;
    friend bool velSaveDrawing(AcDbDatabase& database, const std::string& path, std::string& error);
    // The object of a record, made on first use; null when the record is malformed.
    AcDbObject* objectAt(std::size_t record);
    Acad::ErrorStatus addObject(AcDbObject* object, AcDbHandle owner);

    std::unique_ptr<vel::dxf::DrawingFile> file_;
    std::unordered_map<std::size_t, std::unique_ptr<AcDbObject>> objects_; // by record, as opened or added
    std::string fileName_;
    bool modified_ = false;
};

// Opens any object by id, checked against the wanted class.
template <class T>
Acad::ErrorStatus acdbOpenObject(T*& object, AcDbObjectId id, AcDb::OpenMode mode)
{
    object = nullptr;
    if (id.isNull())
        return Acad::eNullObjectId;
    AcDbObject* any = nullptr;
    Acad::ErrorStatus status = id.database()->openObject(any, id, mode);
    if (status != Acad::eOk)
        return status;
    object = dynamic_cast<T*>(any);
    if (object == nullptr) {
        if (any != nullptr)
            any->close();
        return Acad::eNotThatKindOfClass;
    }
    return Acad::eOk;
}

// Reads a DXF drawing (ASCII or binary, R12 to R2018). On failure `out` is untouched and
// the result names the file, the line (the group of a binary file) and what was expected.
VelReadResult velOpenDrawing(const std::string& path, std::unique_ptr<AcDbDatabase>& out);

// Same, from a buffer in memory; `name` stands for the file in messages.
VelReadResult velReadDrawing(std::string content, const std::string& name, std::unique_ptr<AcDbDatabase>& out);

// Writes the drawing as DXF in its own version (AC1032 for a new drawing): what did not
// change is written back byte for byte. The file is replaced only once complete.
bool velSaveDrawing(AcDbDatabase& database, const std::string& path, std::string& error);

// Same, into a string.
bool velWriteDrawing(AcDbDatabase& database, std::string& out, std::string& error);
