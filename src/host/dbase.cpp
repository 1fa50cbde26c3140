// The drawing database: its objects by record as opened or added, header settings,
// layers, applications and the named-object dictionary, over the drawing's DXF form.
#include "velhost/dbase.h"

#include <algorithm>

#include "host/dxf/drawing.hpp"

using vel::dxf::DrawingFile;
using vel::dxf::ObjectBody;

// ---------------------------------------------------------------- AcDbDatabase

AcDbDatabase::AcDbDatabase() : file_(DrawingFile::New()) {}

AcDbDatabase::AcDbDatabase(std::unique_ptr<DrawingFile> file, std::string fileName)
    : file_(std::move(file)), fileName_(std::move(fileName))
{}

AcDbDatabase::~AcDbDatabase() = default;

AcDbObject* AcDbDatabase::objectAt(std::size_t record)
{
    const auto known = objects_.find(record);
    if (known != objects_.end())
        return known->second.get();
    ObjectBody* body = file_->Body(record);
    if (body == nullptr)
        return nullptr;
    const vel::dxf::Record& rec = file_->records()[record];
    std::unique_ptr<AcDbObject> object;
    if (body->isDictionary)
        object = std::make_unique<AcDbDictionary>();
    else if (rec.type == "XRECORD")
        object = std::make_unique<AcDbXrecord>();
    else if (rec.type == "LAYER" && rec.section == vel::dxf::Section::Tables)
        object = std::make_unique<AcDbLayerTableRecord>();
    else
        object = std::make_unique<AcDbObject>();
    object->own_.reset();
    object->body_ = body;
    object->database_ = this;
    return (objects_[record] = std::move(object)).get();
}

Acad::ErrorStatus AcDbDatabase::addObject(AcDbObject* object, AcDbHandle owner)
{
    std::size_t record = 0;
    if (!object->own_ || !file_->AddObject(object->own_, owner, record))
        return Acad::eNotApplicable;
    object->database_ = this;
    object->writer_ = true;
    objects_[record].reset(object);
    modified_ = true;
    return Acad::eOk;
}

const VelHeaderSettings& AcDbDatabase::headerSettings() const
{
    return file_->settings();
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
        checked, file_->settings());
    if (status != Acad::eOk)
        return status;
    bool changed = false;
    velWalkHeaderVars([&](const VelHeaderVar&, const auto& a, const auto& b) { changed = changed || a != b; }, checked,
                      file_->settings());
    if (changed) {
        file_->settings() = std::move(checked);
        modified_ = true;
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

} // namespace

short AcDbDatabase::aunits() const
{
    return static_cast<short>(file_->settings().aunits);
}
Acad::ErrorStatus AcDbDatabase::setAunits(short value)
{
    return SetOne(*this, &VelHeaderSettings::aunits, int(value));
}
double AcDbDatabase::angbase() const
{
    return file_->settings().angbase;
}
Acad::ErrorStatus AcDbDatabase::setAngbase(double value)
{
    return SetOne(*this, &VelHeaderSettings::angbase, value);
}
bool AcDbDatabase::angdir() const
{
    return file_->settings().angdir;
}
Acad::ErrorStatus AcDbDatabase::setAngdir(bool value)
{
    return SetOne(*this, &VelHeaderSettings::angdir, value);
}
int AcDbDatabase::osmode() const
{
    return file_->settings().osmode;
}
Acad::ErrorStatus AcDbDatabase::setOsmode(int value)
{
    return SetOne(*this, &VelHeaderSettings::osmode, value);
}
AcCmColor AcDbDatabase::cecolor() const
{
    AcCmColor color;
    color.setColorIndex(
        static_cast<short>(file_->settings().cecolor > 256 ? AcCmColor::kByLayer : file_->settings().cecolor));
    return color;
}
Acad::ErrorStatus AcDbDatabase::setCecolor(const AcCmColor& value)
{
    return SetOne(*this, &VelHeaderSettings::cecolor, int(value.colorIndex()));
}
bool AcDbDatabase::attdia() const
{
    return file_->settings().attdia;
}
Acad::ErrorStatus AcDbDatabase::setAttdia(bool value)
{
    return SetOne(*this, &VelHeaderSettings::attdia, value);
}
bool AcDbDatabase::attreq() const
{
    return file_->settings().attreq;
}
Acad::ErrorStatus AcDbDatabase::setAttreq(bool value)
{
    return SetOne(*this, &VelHeaderSettings::attreq, value);
}
bool AcDbDatabase::limcheck() const
{
    return file_->settings().limcheck;
}
Acad::ErrorStatus AcDbDatabase::setLimcheck(bool value)
{
    return SetOne(*this, &VelHeaderSettings::limcheck, value);
}
bool AcDbDatabase::orthomode() const
{
    return file_->settings().orthomode;
}
Acad::ErrorStatus AcDbDatabase::setOrthomode(bool value)
{
    return SetOne(*this, &VelHeaderSettings::orthomode, value);
}

AcDbObjectId AcDbDatabase::clayer() const
{
    AcDbObjectId id;
    getLayerId(file_->settings().clayer, id);
    return id;
}

Acad::ErrorStatus AcDbDatabase::setClayer(AcDbObjectId layerId)
{
    if (layerId.isNull())
        return Acad::eNullObjectId;
    if (layerId.database() != this)
        return Acad::eInvalidInput;
    const std::size_t record = file_->FindRecord(layerId.handle());
    if (std::find(file_->records().layers().begin(), file_->records().layers().end(), record) ==
        file_->records().layers().end())
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
    if (std::find(file_->records().layers().begin(), file_->records().layers().end(), record) ==
        file_->records().layers().end())
        return std::string();
    return file_->RecordName(record);
}

std::vector<std::string> AcDbDatabase::layerNames() const
{
    std::vector<std::string> names;
    for (std::size_t record : file_->records().layers())
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
    if (!file_->AddLayer(name, record))
        return Acad::eNotApplicable;
    modified_ = true;
    id = AcDbObjectId(this, file_->HandleOf(record));
    return Acad::eOk;
}

AcDbObjectId AcDbDatabase::namedObjectsDictionaryId() const
{
    const std::size_t root = file_->records().rootDictionary();
    if (root == SIZE_MAX)
        return AcDbObjectId();
    return AcDbObjectId(const_cast<AcDbDatabase*>(this), file_->HandleOf(root));
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
    AcDbObject* found = objectAt(record);
    if (found == nullptr)
        return Acad::eBadDxfSequence;
    if (found->writer_)
        return Acad::eWasOpenedForWrite;
    if (mode == AcDb::kForWrite) {
        if (found->readers_ > 0)
            return Acad::eWasOpenedForRead;
        found->writer_ = true;
    } else {
        ++found->readers_;
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
    if (!file_->AddApp(name))
        return Acad::eNotApplicable;
    modified_ = true;
    return Acad::eOk;
}

std::string AcDbDatabase::dxfVersion() const
{
    return file_->acadver();
}
const std::string& AcDbDatabase::fileName() const
{
    return fileName_;
}
bool AcDbDatabase::isModified() const
{
    return modified_;
}
std::size_t AcDbDatabase::objectCount() const
{
    std::size_t n = 0;
    const vel::dxf::Sections& records = file_->records();
    for (std::size_t i = 0; i < records.size(); ++i) {
        const std::string_view type = records[i].type;
        if (type != "SECTION" && type != "ENDSEC" && type != "TABLE" && type != "ENDTAB" && type != "CLASS" &&
            type != "EOF")
            ++n;
    }
    return n;
}
