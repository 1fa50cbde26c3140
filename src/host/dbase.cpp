// The drawing database: objects and their open state, dictionaries, XRECORDs, layers,
// header settings, and opening and saving drawings as DXF.
#include "velhost/dbase.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <type_traits>

#include "host/dxf/drawing.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"
#include "text/text.hpp"

using vel::dxf::DrawingFile;
using vel::dxf::ObjectBody;
using vel::dxf::TextEncoding;

const AcDbObjectId AcDbObjectId::kNull;

const char* acadErrorStatusText(Acad::ErrorStatus status)
{
    switch (status) {
    case Acad::eOk: return "eOk";
    case Acad::eNotImplementedYet: return "eNotImplementedYet";
    case Acad::eInvalidInput: return "eInvalidInput";
    case Acad::eNullObjectId: return "eNullObjectId";
    case Acad::eNullObjectPointer: return "eNullObjectPointer";
    case Acad::eKeyNotFound: return "eKeyNotFound";
    case Acad::eDuplicateKey: return "eDuplicateKey";
    case Acad::eInvalidKey: return "eInvalidKey";
    case Acad::eUnknownHandle: return "eUnknownHandle";
    case Acad::eNotThatKindOfClass: return "eNotThatKindOfClass";
    case Acad::eWasOpenedForRead: return "eWasOpenedForRead";
    case Acad::eWasOpenedForWrite: return "eWasOpenedForWrite";
    case Acad::eNotOpenForWrite: return "eNotOpenForWrite";
    case Acad::eNotOpenForRead: return "eNotOpenForRead";
    case Acad::eAlreadyInDb: return "eAlreadyInDb";
    case Acad::eBadDxfSequence: return "eBadDxfSequence";
    case Acad::eRegappIdNotFound: return "eRegappIdNotFound";
    case Acad::eNotApplicable: return "eNotApplicable";
    }
    return "?";
}

Acad::ErrorStatus AcCmColor::setColorIndex(short index)
{
    if (index < 0 || index > 256)
        return Acad::eInvalidInput;
    index_ = index;
    return Acad::eOk;
}

namespace {

// Encoding of the object's database; new objects outside a database hold UTF-8.
const TextEncoding& EncodingOf(const ObjectBody& body)
{
    static const TextEncoding kUtf8;
    return body.database ? body.database->file().encoding : kUtf8;
}

void RegisterApps(AcDbDatabase* db, const std::vector<std::string>& apps)
{
    if (db == nullptr)
        return;
    for (const auto& app : apps)
        if (!db->isRegApp(app))
            db->addRegApp(app);
}

}  // namespace

// ---------------------------------------------------------------- AcDbObject

AcDbObject::AcDbObject() : body_(std::make_unique<ObjectBody>()) {}

AcDbObject::AcDbObject(const char* dxfName) : AcDbObject()
{
    body_->type = dxfName;
    body_->tags.push_back({0, 0, body_->keep(dxfName)});
    body_->entryPos = body_->tags.size();
}

AcDbObject::~AcDbObject() = default;

const std::string& AcDbObject::dxfName() const
{
    return body_->type;
}

AcDbObjectId AcDbObject::objectId() const
{
    return body_->database ? AcDbObjectId(body_->database, body_->handle) : AcDbObjectId();
}

AcDbObjectId AcDbObject::ownerId() const
{
    return body_->database && body_->owner ? AcDbObjectId(body_->database, body_->owner) : AcDbObjectId();
}

AcDbDatabase* AcDbObject::database() const
{
    return body_->database;
}

bool AcDbObject::isReadEnabled() const
{
    return body_->database == nullptr || body_->readers > 0 || body_->writer;
}

bool AcDbObject::isWriteEnabled() const
{
    return body_->database == nullptr || body_->writer;
}

Acad::ErrorStatus AcDbObject::close()
{
    if (body_->writer)
        body_->writer = false;
    else if (body_->readers > 0)
        --body_->readers;
    return Acad::eOk;
}

Acad::ErrorStatus AcDbObject::assertWriteEnabled() const
{
    return isWriteEnabled() ? Acad::eOk : Acad::eNotOpenForWrite;
}

Acad::ErrorStatus AcDbObject::assertReadEnabled() const
{
    return isReadEnabled() ? Acad::eOk : Acad::eNotOpenForRead;
}

resbuf* AcDbObject::xData(const char* regappName) const
{
    return vel::dxf::XDataToRb(body_->xdata, regappName ? regappName : "", EncodingOf(*body_));
}

Acad::ErrorStatus AcDbObject::setXData(const resbuf* xdata)
{
    if (const auto es = assertWriteEnabled(); es != Acad::eOk)
        return es;
    std::vector<std::string> apps;
    std::string error;
    if (!vel::dxf::MergeXData(*body_, xdata, EncodingOf(*body_), apps, error))
        return Acad::eInvalidInput;
    RegisterApps(body_->database, apps);
    if (body_->database)
        body_->database->file().modified = true;
    return Acad::eOk;
}

std::vector<std::string> AcDbObject::xDataApplications() const
{
    return vel::dxf::XDataApps(body_->xdata, EncodingOf(*body_));
}

// ---------------------------------------------------------------- AcDbDictionary

AcDbDictionary::AcDbDictionary() : AcDbObject("DICTIONARY")
{
    body().isDictionary = true;
    body().tags.push_back({100, 0, "AcDbDictionary"});
    body().tags.push_back({281, 0, "1"});
    body().entryPos = body().tags.size();
}

std::uint32_t AcDbDictionary::numEntries() const
{
    return static_cast<std::uint32_t>(body().entries.size());
}

bool AcDbDictionary::has(const std::string& key) const
{
    AcDbObjectId id;
    return getAt(key, id) == Acad::eOk;
}

Acad::ErrorStatus AcDbDictionary::getAt(const std::string& key, AcDbObjectId& id) const
{
    id = AcDbObjectId();
    for (const auto& e : body().entries)
        if (EqualsNoCase(e.key, key)) {
            id = AcDbObjectId(database(), e.handle);
            return Acad::eOk;
        }
    return Acad::eKeyNotFound;
}

Acad::ErrorStatus AcDbDictionary::getAt(const std::string& key, AcDbObject*& object, AcDb::OpenMode mode) const
{
    object = nullptr;
    AcDbObjectId id;
    if (const auto es = getAt(key, id); es != Acad::eOk)
        return es;
    if (id.isNull())
        return Acad::eNullObjectId;
    return database()->openObject(object, id, mode);
}

Acad::ErrorStatus AcDbDictionary::setAt(const std::string& key, AcDbObject* newValue, AcDbObjectId& id)
{
    id = AcDbObjectId();
    if (const auto es = assertWriteEnabled(); es != Acad::eOk)
        return es;
    if (newValue == nullptr)
        return Acad::eNullObjectPointer;
    if (key.empty() || key.find_first_of("\r\n") != std::string::npos)
        return Acad::eInvalidKey;
    if (database() == nullptr)
        return Acad::eNotApplicable;
    if (newValue->database() != nullptr)
        return Acad::eAlreadyInDb;
    if (has(key))
        return Acad::eDuplicateKey;
    DrawingFile& file = database()->file();
    std::string error;
    if (!file.AddObject(newValue, body().handle, error))
        return Acad::eNotApplicable;
    ObjectBody& b = body();
    const int code = b.entries.empty() ? (b.hardOwner ? 360 : 350) : b.entries.back().code;
    b.entries.push_back({key, b.keep(vel::dxf::EncodeText(key, file.encoding)), newValue->body().handle, code, 0});
    b.dirty = true;
    newValue->body().writer = true;
    RegisterApps(database(), newValue->xDataApplications());
    id = newValue->objectId();
    return Acad::eOk;
}

Acad::ErrorStatus AcDbDictionary::remove(const std::string& key)
{
    if (const auto es = assertWriteEnabled(); es != Acad::eOk)
        return es;
    auto& entries = body().entries;
    const auto it = std::find_if(entries.begin(), entries.end(),
                                 [&](const vel::dxf::DictEntry& e) { return EqualsNoCase(e.key, key); });
    if (it == entries.end())
        return Acad::eKeyNotFound;
    entries.erase(it);
    body().dirty = true;
    if (database())
        database()->file().modified = true;
    return Acad::eOk;
}

bool AcDbDictionary::nameAt(AcDbObjectId id, std::string& key) const
{
    for (const auto& e : body().entries)
        if (e.handle == id.handle() && id.database() == database()) {
            key = e.key;
            return true;
        }
    return false;
}

AcDbDictionaryIterator* AcDbDictionary::newIterator(AcRx::DictIterType type) const
{
    std::vector<AcDbDictionaryIterator::Entry> entries;
    for (const auto& e : body().entries)
        entries.push_back({e.key, AcDbObjectId(database(), e.handle)});
    if (type == AcRx::kDictSorted)
        std::stable_sort(entries.begin(), entries.end(), [](const auto& a, const auto& b) {
            return CompareNoCase(a.key, b.key) < 0;
        });
    return new AcDbDictionaryIterator(std::move(entries));
}

bool AcDbDictionaryIterator::next()
{
    if (pos_ < entries_.size())
        ++pos_;
    return !done();
}

const std::string& AcDbDictionaryIterator::name() const
{
    static const std::string kEmpty;
    return done() ? kEmpty : entries_[pos_].key;
}

AcDbObjectId AcDbDictionaryIterator::objectId() const
{
    return done() ? AcDbObjectId() : entries_[pos_].id;
}

Acad::ErrorStatus AcDbDictionaryIterator::getObject(AcDbObject*& object, AcDb::OpenMode mode) const
{
    object = nullptr;
    if (done())
        return Acad::eKeyNotFound;
    return acdbOpenObject(object, entries_[pos_].id, mode);
}

// ---------------------------------------------------------------- AcDbXrecord

AcDbXrecord::AcDbXrecord() : AcDbObject("XRECORD")
{
    body().tags.push_back({100, 0, "AcDbXrecord"});
    body().tags.push_back({280, 0, "1"});
    body().entryPos = body().tags.size();
}

Acad::ErrorStatus AcDbXrecord::rbChain(resbuf*& list) const
{
    list = vel::dxf::XrecordToRb(body(), EncodingOf(body()));
    return Acad::eOk;
}

Acad::ErrorStatus AcDbXrecord::setFromRbChain(const resbuf* list)
{
    if (const auto es = assertWriteEnabled(); es != Acad::eOk)
        return es;
    std::string error;
    if (!vel::dxf::SetXrecordData(body(), list, EncodingOf(body()), error))
        return Acad::eInvalidInput;
    if (database())
        database()->file().modified = true;
    return Acad::eOk;
}

// ---------------------------------------------------------------- AcDbLayerTableRecord

AcDbLayerTableRecord::AcDbLayerTableRecord() : AcDbObject("LAYER") {}

std::string AcDbLayerTableRecord::name() const
{
    return vel::dxf::DecodeText(vel::dxf::TrimRight(vel::dxf::FirstValue(body(), 2)), EncodingOf(body()));
}

AcCmColor AcDbLayerTableRecord::color() const
{
    AcCmColor color;
    const auto v = ParseInt(vel::dxf::FirstValue(body(), 62));
    color.setColorIndex(static_cast<short>(v ? std::min(std::llabs(*v), 256LL) : 7));
    return color;
}

// ---------------------------------------------------------------- AcDbDatabase

namespace vel::dxf {
std::string_view NewDrawingDxf();
}

AcDbDatabase::AcDbDatabase()
{
    auto source = std::make_unique<vel::dxf::Source>();
    source->Own(std::string(vel::dxf::NewDrawingDxf()));
    std::string error;
    if (!DrawingFile::Load(*this, std::move(source), "", error)) {
        std::fprintf(stderr, "dessin vierge illisible : %s\n", error.c_str());
        std::abort();
    }
}

AcDbDatabase::AcDbDatabase(Tag) {}

AcDbDatabase::~AcDbDatabase() = default;

const VelHeaderSettings& AcDbDatabase::headerSettings() const
{
    return file_->settings;
}

Acad::ErrorStatus AcDbDatabase::setHeaderSettings(const VelHeaderSettings& wanted)
{
    VelHeaderSettings checked = wanted;
    Acad::ErrorStatus status = Acad::eOk;
    velWalkHeaderVars(
        [&](const VelHeaderVar& var, auto& value, const auto& current) {
            using Field = std::remove_cvref_t<decltype(value)>;
            if constexpr (std::is_same_v<Field, int>) {
                if (value < var.min || value > var.max)
                    status = Acad::eInvalidInput;
            } else if constexpr (std::is_same_v<Field, std::string>) {
                // The layer as the table spells it; one the file named without a record stays.
                if (value == current)
                    return;
                const std::size_t record = file_->LayerRecord(value);
                if (record == SIZE_MAX && status == Acad::eOk)
                    status = Acad::eKeyNotFound;
                else if (record != SIZE_MAX)
                    value = file_->RecordName(record);
            }
        },
        checked, file_->settings);
    if (status != Acad::eOk)
        return status;
    bool changed = false;
    velWalkHeaderVars([&](const VelHeaderVar&, const auto& a, const auto& b) { changed = changed || a != b; },
                      checked, file_->settings);
    if (changed) {
        file_->settings = std::move(checked);
        file_->modified = true;
    }
    return Acad::eOk;
}

namespace {

// One setting changed through the whole-settings check.
template <class T>
Acad::ErrorStatus SetOne(AcDbDatabase& db, T VelHeaderSettings::*member, T value)
{
    VelHeaderSettings settings = db.headerSettings();
    settings.*member = value;
    return db.setHeaderSettings(settings);
}

}  // namespace

short AcDbDatabase::aunits() const { return static_cast<short>(file_->settings.aunits); }
Acad::ErrorStatus AcDbDatabase::setAunits(short value) { return SetOne(*this, &VelHeaderSettings::aunits, int(value)); }
double AcDbDatabase::angbase() const { return file_->settings.angbase; }
Acad::ErrorStatus AcDbDatabase::setAngbase(double value) { return SetOne(*this, &VelHeaderSettings::angbase, value); }
bool AcDbDatabase::angdir() const { return file_->settings.angdir; }
Acad::ErrorStatus AcDbDatabase::setAngdir(bool value) { return SetOne(*this, &VelHeaderSettings::angdir, value); }
int AcDbDatabase::osmode() const { return file_->settings.osmode; }
Acad::ErrorStatus AcDbDatabase::setOsmode(int value) { return SetOne(*this, &VelHeaderSettings::osmode, value); }
AcCmColor AcDbDatabase::cecolor() const
{
    AcCmColor color;
    color.setColorIndex(static_cast<short>(file_->settings.cecolor > 256 ? AcCmColor::kByLayer : file_->settings.cecolor));
    return color;
}
Acad::ErrorStatus AcDbDatabase::setCecolor(const AcCmColor& value)
{
    return SetOne(*this, &VelHeaderSettings::cecolor, int(value.colorIndex()));
}
bool AcDbDatabase::attdia() const { return file_->settings.attdia; }
Acad::ErrorStatus AcDbDatabase::setAttdia(bool value) { return SetOne(*this, &VelHeaderSettings::attdia, value); }
bool AcDbDatabase::attreq() const { return file_->settings.attreq; }
Acad::ErrorStatus AcDbDatabase::setAttreq(bool value) { return SetOne(*this, &VelHeaderSettings::attreq, value); }
bool AcDbDatabase::limcheck() const { return file_->settings.limcheck; }
Acad::ErrorStatus AcDbDatabase::setLimcheck(bool value) { return SetOne(*this, &VelHeaderSettings::limcheck, value); }
bool AcDbDatabase::orthomode() const { return file_->settings.orthomode; }
Acad::ErrorStatus AcDbDatabase::setOrthomode(bool value)
{
    return SetOne(*this, &VelHeaderSettings::orthomode, value);
}

AcDbObjectId AcDbDatabase::clayer() const
{
    AcDbObjectId id;
    getLayerId(file_->settings.clayer, id);
    return id;
}

Acad::ErrorStatus AcDbDatabase::setClayer(AcDbObjectId layerId)
{
    if (layerId.isNull())
        return Acad::eNullObjectId;
    if (layerId.database() != this)
        return Acad::eInvalidInput;
    const std::size_t record = file_->FindRecord(layerId.handle());
    if (std::find(file_->layers.begin(), file_->layers.end(), record) == file_->layers.end())
        return Acad::eNotThatKindOfClass;
    return SetOne(*this, &VelHeaderSettings::clayer, file_->RecordName(record));
}

Acad::ErrorStatus AcDbDatabase::getLayerId(const std::string& name, AcDbObjectId& id) const
{
    id = AcDbObjectId();
    const std::size_t record = file_->LayerRecord(name);
    if (record == SIZE_MAX)
        return Acad::eKeyNotFound;
    id = AcDbObjectId(const_cast<AcDbDatabase*>(this), file_->HandleOf(record));
    return Acad::eOk;
}

std::string AcDbDatabase::layerName(AcDbObjectId layerId) const
{
    if (layerId.database() != this)
        return std::string();
    const std::size_t record = file_->FindRecord(layerId.handle());
    if (std::find(file_->layers.begin(), file_->layers.end(), record) == file_->layers.end())
        return std::string();
    return file_->RecordName(record);
}

std::vector<std::string> AcDbDatabase::layerNames() const
{
    std::vector<std::string> names;
    for (std::size_t record : file_->layers)
        names.push_back(file_->RecordName(record));
    return names;
}

Acad::ErrorStatus AcDbDatabase::addLayer(const std::string& name, AcDbObjectId& id)
{
    id = AcDbObjectId();
    if (name.empty() || name.find_first_of("\r\n<>/\\\":;?*|=`") != std::string::npos)
        return Acad::eInvalidInput;
    if (file_->LayerRecord(name) != SIZE_MAX)
        return Acad::eDuplicateKey;
    std::size_t record = 0;
    std::string error;
    if (!file_->AddLayer(name, record, error))
        return Acad::eNotApplicable;
    id = AcDbObjectId(this, file_->HandleOf(record));
    return Acad::eOk;
}

AcDbObjectId AcDbDatabase::namedObjectsDictionaryId() const
{
    if (file_->rootDictionary == SIZE_MAX)
        return AcDbObjectId();
    return AcDbObjectId(const_cast<AcDbDatabase*>(this), file_->HandleOf(file_->rootDictionary));
}

Acad::ErrorStatus AcDbDatabase::getNamedObjectsDictionary(AcDbDictionary*& dictionary, AcDb::OpenMode mode)
{
    dictionary = nullptr;
    const AcDbObjectId id = namedObjectsDictionaryId();
    if (id.isNull())
        return Acad::eNotApplicable;
    return acdbOpenObject(dictionary, id, mode);
}

Acad::ErrorStatus AcDbDatabase::openObject(AcDbObject*& object, AcDbObjectId id, AcDb::OpenMode mode)
{
    object = nullptr;
    if (id.isNull())
        return Acad::eNullObjectId;
    if (id.database() != this)
        return Acad::eInvalidInput;
    const std::size_t record = file_->FindRecord(id.handle());
    if (record == SIZE_MAX)
        return Acad::eUnknownHandle;
    AcDbObject* found = file_->ObjectAt(record);
    if (found == nullptr)
        return Acad::eBadDxfSequence;
    ObjectBody& body = found->body();
    if (body.writer)
        return Acad::eWasOpenedForWrite;
    if (mode == AcDb::kForWrite) {
        if (body.readers > 0)
            return Acad::eWasOpenedForRead;
        body.writer = true;
    } else {
        ++body.readers;
    }
    object = found;
    return Acad::eOk;
}

AcDbObjectId AcDbDatabase::idFromHandle(AcDbHandle handle) const
{
    if (handle == 0 || file_->FindRecord(handle) == SIZE_MAX)
        return AcDbObjectId();
    return AcDbObjectId(const_cast<AcDbDatabase*>(this), handle);
}

bool AcDbDatabase::isRegApp(const std::string& name) const
{
    return file_->AppRecord(name) != SIZE_MAX;
}

Acad::ErrorStatus AcDbDatabase::addRegApp(const std::string& name)
{
    if (name.empty() || name.find_first_of("\r\n") != std::string::npos)
        return Acad::eInvalidInput;
    if (isRegApp(name))
        return Acad::eDuplicateKey;
    std::string error;
    return file_->AddApp(name, error) ? Acad::eOk : Acad::eNotApplicable;
}

std::string AcDbDatabase::dxfVersion() const { return file_->acadver; }
const std::string& AcDbDatabase::fileName() const { return file_->fileName; }
bool AcDbDatabase::isModified() const { return file_->modified; }
std::size_t AcDbDatabase::objectCount() const
{
    std::size_t n = 0;
    for (const auto& r : file_->records)
        if (r.type != "SECTION" && r.type != "ENDSEC" && r.type != "TABLE" && r.type != "ENDTAB" &&
            r.type != "CLASS" && r.type != "EOF")
            ++n;
    return n;
}

// ---------------------------------------------------------------- files

bool velOpenDrawing(const std::string& path, std::unique_ptr<AcDbDatabase>& out, std::string& error)
{
    auto source = std::make_unique<vel::dxf::Source>();
    if (!source->Load(path, error))
        return false;
    return DrawingFile::Read(std::move(source), path, out, error);
}

bool velReadDrawing(std::string content, const std::string& name, std::unique_ptr<AcDbDatabase>& out,
                    std::string& error)
{
    auto source = std::make_unique<vel::dxf::Source>();
    source->Own(std::move(content));
    return DrawingFile::Read(std::move(source), name, out, error);
}

bool velWriteDrawing(AcDbDatabase& database, std::string& out, std::string& error)
{
    out.clear();
    out.reserve(database.file().source->view().size() + 4096);
    return database.file().Write(
        [&](std::string_view piece) {
            out.append(piece);
            return true;
        },
        error);
}

bool velSaveDrawing(AcDbDatabase& database, const std::string& path, std::string& error)
{
    VelAtomicFile file(path);
    VelFileResult result = file.open();
    std::string writeError;
    if (result && !database.file().Write(
                      [&](std::string_view piece) {
                          result = file.write(piece);
                          return result.ok;
                      },
                      writeError)) {
        error = result ? FormatString("« %s » : %s", path.c_str(), writeError.c_str()) : result.message;
        return false;
    }
    if (result)
        result = file.commit();
    if (!result) {
        error = result.message;
        return false;
    }
    if (!result.message.empty())
        acutPrintf("%s\n", result.message.c_str());
    database.file().fileName = path;
    database.file().modified = false;
    return true;
}
