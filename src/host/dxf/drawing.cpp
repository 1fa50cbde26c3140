// Reading a whole drawing (its records, then the header, the handle index and the
// dictionaries, each by its own layer) and the objects of its records, read on first use
// or added by the host.
#include "host/dxf/drawing.hpp"

#include <algorithm>

#include "host/dxf/binary.hpp"
#include "text/text.hpp"

namespace vel::dxf {

DrawingFile::~DrawingFile() = default;

VelReadResult DrawingFile::Read(std::unique_ptr<Source> source, const std::string& name,
                                std::unique_ptr<DrawingFile>& out)
{
    std::unique_ptr<DrawingFile> file(new DrawingFile);
    file->name_ = name;
    if (IsBinaryDxf(source->view())) {
        file->binary_ = true;
        std::string text;
        std::uint64_t group = 0;
        std::string expected;
        if (!BinaryToText(source->view(), text, file->wideCodes_, group, expected))
            return file->FailAtGroup(group, expected);
        source = std::make_unique<Source>();
        source->Own(std::move(text));
    }
    VelReadResult result = file->Load(std::move(source));
    if (result)
        out = std::move(file);
    return result;
}

std::unique_ptr<DrawingFile> DrawingFile::Copy() const
{
    std::unique_ptr<DrawingFile> copy(new DrawingFile);
    copy->source_ = source_;
    copy->name_ = name_;
    copy->binary_ = binary_;
    copy->wideCodes_ = wideCodes_;
    copy->sections_ = sections_;
    copy->header_ = header_;
    copy->handles_ = handles_;
    copy->sourceCount_ = sourceCount_;
    copy->bodies_.resize(sourceCount_);
    return copy;
}

VelReadResult DrawingFile::Load(std::shared_ptr<const Source> source)
{
    source_ = std::move(source);
    const std::string_view text = source_->view();
    ParseError pe;
    bool ok = sections_.Read(text, pe);
    if (ok)
        ok = header_.Read(text, sections_.header() == SIZE_MAX ? nullptr : &sections_[sections_.header()], pe);
    if (ok && header_.encoding().utf8) {
        const std::size_t bad = FindInvalidUtf8(text);
        if (bad != std::string_view::npos) {
            pe = {LineOfOffset(text, bad), "un texte UTF-8 valide"};
            ok = false;
        }
    }
    sourceCount_ = sections_.size();
    bodies_.resize(sourceCount_);
    ok = ok && handles_.Index(sections_, header_.handseed(), pe) && CheckDictionaries(pe);
    return ok ? VelReadResult{} : Fail(pe.line, pe.expected);
}

VelReadResult DrawingFile::Fail(std::uint32_t line, const std::string& expected) const
{
    // The text form of a binary drawing has two lines per group.
    if (binary_)
        return FailAtGroup((line + 1) / 2, expected);
    return VelReadResult::Malformed(name_, line, expected);
}

VelReadResult DrawingFile::FailAtGroup(std::uint64_t group, const std::string& expected) const
{
    return VelReadResult::Malformed(name_, static_cast<std::int64_t>(group), expected,
                                    FormatString("« %s » (DXF binaire), groupe %llu : il fallait %s", name_.c_str(),
                                                 static_cast<unsigned long long>(group), expected.c_str()));
}

bool DrawingFile::CheckDictionaries(ParseError& error)
{
    std::vector<std::size_t> dictionaries;
    for (std::size_t i = 0; i < sections_.size(); ++i)
        if (IsDictionaryType(sections_[i].type))
            dictionaries.push_back(i);
    // Every object the host needs at once is read now, so that a malformed one refuses
    // the file instead of going missing later.
    std::vector<std::size_t> eager = dictionaries;
    eager.insert(eager.end(), sections_.layers().begin(), sections_.layers().end());
    eager.insert(eager.end(), sections_.apps().begin(), sections_.apps().end());
    for (std::size_t i : eager) {
        if (!Body(i, &error))
            return false;
    }
    for (std::size_t i : dictionaries)
        for (const auto& e : bodies_[i]->entries)
            if (e.handle == 0 || handles_.FindInFile(e.handle) == SIZE_MAX) {
                error = {e.line, FormatString("une entrée vers un objet du dessin (l'identifiant %s de « %s » "
                                              "n'existe pas)",
                                              FormatHandle(e.handle).c_str(), e.key.c_str())};
                return false;
            }
    // Depth-first walk over dictionary entries: 1 on the path, 2 done.
    std::vector<std::uint8_t> state(sections_.size(), 0);
    struct Frame {
        std::size_t record;
        std::size_t next;
    };
    for (std::size_t root : dictionaries) {
        if (state[root] != 0)
            continue;
        std::vector<Frame> stack{{root, 0}};
        state[root] = 1;
        while (!stack.empty()) {
            Frame& f = stack.back();
            const auto& entries = bodies_[f.record]->entries;
            if (f.next == entries.size()) {
                state[f.record] = 2;
                stack.pop_back();
                continue;
            }
            const DictEntry& e = entries[f.next++];
            const std::size_t child = handles_.FindInFile(e.handle);
            if (!IsDictionaryType(sections_[child].type))
                continue;
            if (state[child] == 1) {
                error = {e.line, FormatString("une entrée qui ne remonte pas à un dictionnaire parent (« %s » "
                                              "ramène au dictionnaire de la ligne %u)",
                                              e.key.c_str(), sections_[child].line)};
                return false;
            }
            if (state[child] == 0) {
                state[child] = 1;
                stack.push_back({child, 0});
            }
        }
    }
    return true;
}

ObjectBody* DrawingFile::Body(std::size_t record, ParseError* failure)
{
    if (record >= bodies_.size())
        return nullptr;
    if (bodies_[record])
        return bodies_[record].get();
    const Record& rec = sections_[record];
    auto body = std::make_unique<ObjectBody>();
    ParseError pe;
    if (!ParseObject(source_->view().substr(rec.begin, rec.end - rec.begin), rec.line, encoding(), *body, pe)) {
        if (failure)
            *failure = pe;
        return nullptr;
    }
    body->handle = HandleOf(record);
    bodies_[record] = std::move(body);
    return bodies_[record].get();
}

bool DrawingFile::AddRecord(std::unique_ptr<ObjectBody>&& body, std::size_t before, Section section,
                            std::uint64_t owner, bool withHandle, std::size_t& record)
{
    Record rec;
    rec.added = true;
    rec.section = section;
    if (handles_.next() == 0)
        return false;
    record = sections_.size();
    if (withHandle)
        rec.handle = handles_.Add(record);
    body->owner = owner;
    body->dirty = true;
    std::vector<Tag> head;
    if (withHandle) {
        head.push_back({5, 0, body->keep(FormatHandle(rec.handle))});
        body->handleWritten = true;
        if (section == Section::Objects && owner != 0) {
            head.push_back({102, 0, "{ACAD_REACTORS"});
            head.push_back({330, 0, body->keep(FormatHandle(owner))});
            head.push_back({102, 0, "}"});
        }
        head.push_back({330, 0, body->keep(FormatHandle(owner))});
    }
    body->tags.insert(body->tags.begin() + 1, head.begin(), head.end());
    body->entryPos += head.size();
    sections_.Add(rec);
    bodies_.push_back(std::move(body));
    sections_.SetType(record, bodies_.back()->type);
    bodies_.back()->handle = HandleOf(record);
    insertions_[before].push_back(record);
    return true;
}

bool DrawingFile::AddObject(std::unique_ptr<ObjectBody>& body, std::uint64_t owner, std::size_t& record)
{
    // An R12 drawing has no OBJECTS section to hold it.
    if (sections_.objectsEnd() == SIZE_MAX || handles_.next() == 0)
        return false;
    return AddRecord(std::move(body), sections_.objectsEnd(), Section::Objects, owner, true, record);
}

std::size_t DrawingFile::LayerRecord(const std::string& name)
{
    for (std::size_t i : sections_.layers())
        if (EqualsNoCase(RecordName(i), name))
            return i;
    return SIZE_MAX;
}

std::size_t DrawingFile::AppRecord(const std::string& name)
{
    for (std::size_t i : sections_.apps())
        if (EqualsNoCase(RecordName(i), name))
            return i;
    return SIZE_MAX;
}

std::string DrawingFile::RecordName(std::size_t record)
{
    const ObjectBody* body = Body(record);
    return body ? DecodeText(TrimRight(FirstValue(*body, 2)), encoding()) : std::string();
}

namespace {

std::unique_ptr<ObjectBody> NewTableRecord(const char* type, const char* subclass, bool r12)
{
    auto body = std::make_unique<ObjectBody>();
    body->type = type;
    body->tags.push_back({0, 0, type});
    if (!r12) {
        body->tags.push_back({100, 0, "AcDbSymbolTableRecord"});
        body->tags.push_back({100, 0, subclass});
    }
    return body;
}

} // namespace

bool DrawingFile::AddLayer(const std::string& name, std::size_t& record)
{
    const std::size_t end = sections_.TableEnd("LAYER");
    if (end == SIZE_MAX)
        return false;
    const bool r12 = acadver() <= "AC1009";
    auto body = NewTableRecord("LAYER", "AcDbLayerTableRecord", r12);
    body->tags.push_back({2, 0, body->keep(EncodeText(name, encoding()))});
    body->tags.push_back({70, 0, "0"});
    body->tags.push_back({62, 0, "7"});
    body->tags.push_back({6, 0, r12 ? "CONTINUOUS" : "Continuous"});
    body->entryPos = body->tags.size();
    if (!AddRecord(std::move(body), end, Section::Tables, sections_.TableHandle("LAYER"), !r12, record))
        return false;
    sections_.AddLayer(record);
    return true;
}

bool DrawingFile::AddApp(const std::string& name)
{
    const std::size_t end = sections_.TableEnd("APPID");
    if (end == SIZE_MAX)
        return false;
    const bool r12 = acadver() <= "AC1009";
    auto body = NewTableRecord("APPID", "AcDbRegAppTableRecord", r12);
    body->tags.push_back({2, 0, body->keep(EncodeText(name, encoding()))});
    body->tags.push_back({70, 0, "0"});
    body->entryPos = body->tags.size();
    std::size_t record = 0;
    if (!AddRecord(std::move(body), end, Section::Tables, sections_.TableHandle("APPID"), !r12, record))
        return false;
    sections_.AddApp(record);
    return true;
}

std::vector<std::string> DrawingFile::ChangedHeaderVars() const
{
    std::vector<std::string> changed = header_.Changed();
    // A seed the file left too low is raised only when something is written anyway, so
    // that a drawing saved without change stays byte for byte the same.
    const bool anyChange = !changed.empty() || handles_.AnyAdded() ||
                           std::any_of(bodies_.begin(), bodies_.end(), [](const auto& b) { return b && b->dirty; });
    if (handles_.next() > header_.handseed() && (header_.HasSeed() || handles_.AnyAdded()) && anyChange)
        changed.push_back("$HANDSEED");
    return changed;
}

} // namespace vel::dxf
