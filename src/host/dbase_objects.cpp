// The drawing's objects: any object with its XData and open state, XRECORDs, layer
// records, colours, and the names of the error statuses.
#include <string>
#include <vector>

#include "host/dbase_internal.h"
#include "host/dxf/drawing.hpp"
#include "text/text.hpp"
#include "velhost/dbase.h"

using vel::dxf::ObjectBody;
using vel::dxf::TextEncoding;

const AcDbObjectId AcDbObjectId::kNull;

const char* acadErrorStatusText(Acad::ErrorStatus status)
{
    switch (status) {
    case Acad::eOk:
        return "eOk";
    case Acad::eNotImplementedYet:
        return "eNotImplementedYet";
    case Acad::eInvalidInput:
        return "eInvalidInput";
    case Acad::eNullObjectId:
        return "eNullObjectId";
    case Acad::eNullObjectPointer:
        return "eNullObjectPointer";
    case Acad::eKeyNotFound:
        return "eKeyNotFound";
    case Acad::eDuplicateKey:
        return "eDuplicateKey";
    case Acad::eInvalidKey:
        return "eInvalidKey";
    case Acad::eUnknownHandle:
        return "eUnknownHandle";
    case Acad::eNotThatKindOfClass:
        return "eNotThatKindOfClass";
    case Acad::eWasOpenedForRead:
        return "eWasOpenedForRead";
    case Acad::eWasOpenedForWrite:
        return "eWasOpenedForWrite";
    case Acad::eNotOpenForWrite:
        return "eNotOpenForWrite";
    case Acad::eNotOpenForRead:
        return "eNotOpenForRead";
    case Acad::eAlreadyInDb:
        return "eAlreadyInDb";
    case Acad::eBadDxfSequence:
        return "eBadDxfSequence";
    case Acad::eRegappIdNotFound:
        return "eRegappIdNotFound";
    case Acad::eNotApplicable:
        return "eNotApplicable";
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

// New objects outside a database hold UTF-8.
const TextEncoding kUtf8;

} // namespace

const TextEncoding& velEncodingOf(const AcDbObject& object)
{
    return object.database() ? object.database()->file().encoding() : kUtf8;
}

void velRegisterApps(AcDbDatabase* database, const std::vector<std::string>& apps)
{
    if (database == nullptr)
        return;
    for (const auto& app : apps)
        if (!database->isRegApp(app))
            database->addRegApp(app);
}

// ---------------------------------------------------------------- AcDbObject

AcDbObject::AcDbObject() : own_(std::make_unique<ObjectBody>()), body_(own_.get()) {}

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
    return database_ ? AcDbObjectId(database_, body_->handle) : AcDbObjectId();
}

AcDbObjectId AcDbObject::ownerId() const
{
    return database_ && body_->owner ? AcDbObjectId(database_, body_->owner) : AcDbObjectId();
}

AcDbDatabase* AcDbObject::database() const
{
    return database_;
}

bool AcDbObject::isReadEnabled() const
{
    return database_ == nullptr || readers_ > 0 || writer_;
}

bool AcDbObject::isWriteEnabled() const
{
    return database_ == nullptr || writer_;
}

Acad::ErrorStatus AcDbObject::close()
{
    if (writer_)
        writer_ = false;
    else if (readers_ > 0)
        --readers_;
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

Acad::ErrorStatus AcDbObject::addToDatabase(AcDbObject* newObject)
{
    return database_ ? database_->addObject(newObject, body_->handle) : Acad::eNotApplicable;
}

void AcDbObject::noteChange()
{
    if (database_)
        database_->modified_ = true;
}

resbuf* AcDbObject::xData(const char* regappName) const
{
    return vel::dxf::XDataToRb(body_->xdata, regappName ? regappName : "", velEncodingOf(*this));
}

Acad::ErrorStatus AcDbObject::setXData(const resbuf* xdata)
{
    if (const auto es = assertWriteEnabled(); es != Acad::eOk)
        return es;
    std::vector<std::string> apps;
    std::string error;
    if (!vel::dxf::MergeXData(*body_, xdata, velEncodingOf(*this), apps, error))
        return Acad::eInvalidInput;
    velRegisterApps(database_, apps);
    noteChange();
    return Acad::eOk;
}

std::vector<std::string> AcDbObject::xDataApplications() const
{
    return vel::dxf::XDataApps(body_->xdata, velEncodingOf(*this));
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
    list = vel::dxf::XrecordToRb(body(), velEncodingOf(*this));
    return Acad::eOk;
}

Acad::ErrorStatus AcDbXrecord::setFromRbChain(const resbuf* list)
{
    if (const auto es = assertWriteEnabled(); es != Acad::eOk)
        return es;
    std::string error;
    if (!vel::dxf::SetXrecordData(body(), list, velEncodingOf(*this), error))
        return Acad::eInvalidInput;
    noteChange();
    return Acad::eOk;
}

// ---------------------------------------------------------------- AcDbLayerTableRecord

AcDbLayerTableRecord::AcDbLayerTableRecord() : AcDbObject("LAYER") {}

std::string AcDbLayerTableRecord::name() const
{
    return vel::dxf::DecodeText(vel::dxf::TrimRight(vel::dxf::FirstValue(body(), 2)), velEncodingOf(*this));
}

AcCmColor AcDbLayerTableRecord::color() const
{
    AcCmColor color;
    const auto v = ParseInt(vel::dxf::FirstValue(body(), 62));
    color.setColorIndex(static_cast<short>(v ? std::min(std::llabs(*v), 256LL) : 7));
    return color;
}
