// Dictionaries: entries by key without regard to case, in file order, and their iterator.
#include <algorithm>

#include "host/dbase_internal.h"
#include "host/dxf/drawing.hpp"
#include "text/text.hpp"
#include "velhost/dbase.h"

using vel::dxf::ObjectBody;

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
    if (const auto es = addToDatabase(newValue); es != Acad::eOk)
        return es;
    ObjectBody& b = body();
    const int code = b.entries.empty() ? (b.hardOwner ? 360 : 350) : b.entries.back().code;
    b.entries.push_back(
        {key, b.keep(vel::dxf::EncodeText(key, velEncodingOf(*this))), newValue->body().handle, code, 0});
    b.dirty = true;
    velRegisterApps(database(), newValue->xDataApplications());
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
    noteChange();
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
        std::stable_sort(entries.begin(), entries.end(),
                         [](const auto& a, const auto& b) { return CompareNoCase(a.key, b.key) < 0; });
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
