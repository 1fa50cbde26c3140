// Reading a whole DXF drawing (one pass over the file read into memory that cuts it into
// records, then the header, the handle index and the dictionaries) and writing it back,
// copying the bytes of everything that did not change.
#include "host/dxf/drawing.hpp"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <type_traits>

#include "host/dxf/binary.hpp"
#include "text/text.hpp"

namespace vel::dxf {
namespace {

Section SectionOf(std::string_view name)
{
    if (name == "HEADER")
        return Section::Header;
    if (name == "CLASSES")
        return Section::Classes;
    if (name == "TABLES")
        return Section::Tables;
    if (name == "BLOCKS")
        return Section::Blocks;
    if (name == "ENTITIES")
        return Section::Entities;
    if (name == "OBJECTS")
        return Section::Objects;
    return Section::Other;
}

bool IsDictionaryType(std::string_view type)
{
    return type == "DICTIONARY" || type == "ACDBDICTIONARYWDFLT";
}

}  // namespace

// Gathers consecutive pieces: runs of the source bytes are passed on in one piece, new
// text is buffered.
class Writer {
public:
    Writer(std::string_view source, const std::function<bool(std::string_view)>& sink)
        : source_(source), sink_(sink)
    {
    }

    void Raw(std::uint64_t begin, std::uint64_t end)
    {
        if (begin >= end)
            return;
        FlushPending();
        if (run_ && runEnd_ == begin) {
            runEnd_ = end;
            return;
        }
        FlushRun();
        run_ = true;
        runBegin_ = begin;
        runEnd_ = end;
    }

    std::string& Buffer()
    {
        FlushRun();
        return pending_;
    }

    void Text(std::string_view text)
    {
        Buffer().append(text);
        if (pending_.size() > (1u << 20))
            FlushPending();
    }

    bool Finish()
    {
        FlushRun();
        FlushPending();
        return ok_;
    }

private:
    void FlushRun()
    {
        if (!run_)
            return;
        run_ = false;
        if (ok_)
            ok_ = sink_(source_.substr(runBegin_, runEnd_ - runBegin_));
    }

    void FlushPending()
    {
        if (pending_.empty())
            return;
        if (ok_)
            ok_ = sink_(pending_);
        pending_.clear();
    }

    std::string_view source_;
    const std::function<bool(std::string_view)>& sink_;
    std::string pending_;
    bool run_ = false;
    std::uint64_t runBegin_ = 0;
    std::uint64_t runEnd_ = 0;
    bool ok_ = true;
};

Source::~Source()
{
    if (buffer_ != nullptr)
        munmap(buffer_, capacity_);
}

bool Source::Load(const std::string& path, std::string& error)
{
    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        error = FormatString("« %s » : impossible d'ouvrir le fichier (%s)", path.c_str(), std::strerror(errno));
        return false;
    }
    struct stat st {};
    if (fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
        error = FormatString("« %s » : ce n'est pas un fichier ordinaire", path.c_str());
        close(fd);
        return false;
    }
    const auto fail = [&](int err) {
        error = FormatString("« %s » : lecture impossible (%s)", path.c_str(), std::strerror(err));
        close(fd);
        return false;
    };
    // Memory of its own rather than the heap: in large pages where the system has them,
    // filling it costs no more than mapping the file did.
    std::size_t capacity = static_cast<std::size_t>(st.st_size) + 1;
    void* buffer = mmap(nullptr, capacity, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (buffer == MAP_FAILED)
        return fail(errno);
    madvise(buffer, capacity, MADV_HUGEPAGE);
    // One read of the size announced; a file that grows meanwhile is read to its end, one
    // that shrinks is what is left of it.
    std::size_t size = 0;
    for (;;) {
        if (size == capacity) {
            void* larger = mremap(buffer, capacity, capacity * 2, MREMAP_MAYMOVE);
            if (larger == MAP_FAILED) {
                munmap(buffer, capacity);
                return fail(errno);
            }
            buffer = larger;
            capacity *= 2;
        }
        const ssize_t n = read(fd, static_cast<char*>(buffer) + size, capacity - size);
        if (n < 0 && errno == EINTR)
            continue;
        if (n < 0) {
            const int err = errno;
            munmap(buffer, capacity);
            return fail(err);
        }
        if (n == 0)
            break;
        size += static_cast<std::size_t>(n);
    }
    close(fd);
    if (buffer_ != nullptr)
        munmap(buffer_, capacity_);
    buffer_ = buffer;
    capacity_ = capacity;
    data_ = static_cast<const char*>(buffer);
    size_ = size;
    return true;
}

void Source::Own(std::string content)
{
    owned_ = std::move(content);
    data_ = owned_.data();
    size_ = owned_.size();
}

DrawingFile::DrawingFile(AcDbDatabase* db) : database(db) {}

DrawingFile::~DrawingFile() = default;

std::string DrawingFile::Where(std::uint32_t line) const
{
    if (binary)
        return FormatString("« %s » (DXF binaire), groupe %u", fileName.c_str(), (line + 1) / 2);
    return FormatString("« %s », ligne %u", fileName.c_str(), line);
}

std::string DrawingFile::Fail(std::uint32_t line, const std::string& expected) const
{
    return Where(line) + " : il fallait " + expected;
}

bool DrawingFile::Scan(std::string& error)
{
    const std::string_view buf = source->view();
    if (buf.substr(0, 18) == "AutoCAD Binary DXF") {
        error = Fail(1, "la signature complète du DXF binaire");
        return false;
    }
    std::size_t start = buf.substr(0, 3) == "\xEF\xBB\xBF" ? 3 : 0;
    const std::size_t firstNl = buf.find('\n');
    eol = firstNl != std::string_view::npos && firstNl > 0 && buf[firstNl - 1] == '\r' ? "\r\n" : "\n";

    TagReader reader(buf, start, 1);
    records.reserve(buf.size() / 96 + 16);
    Tag t;
    Section section = Section::None;
    bool wantSectionName = false;
    bool handleDone = true;
    bool isDimstyle = false;
    bool inXData = false;
    XDataChecker checker;
    std::size_t tagStart = reader.offset();
    Record* cur = nullptr;
    while (reader.next(t)) {
        if (t.code == 0) {
            if (inXData) {
                if (!checker.Finish()) {
                    error = Fail(t.line, checker.expected());
                    return false;
                }
                inXData = false;
            }
            if (wantSectionName) {
                error = Fail(t.line, "le nom de la section (code 2)");
                return false;
            }
            if (cur)
                cur->end = tagStart;
            Record rec;
            rec.begin = tagStart;
            rec.line = t.line;
            rec.type = TrimRight(t.value);
            rec.section = section;
            handleDone = true;
            if (rec.type == "SECTION") {
                if (section != Section::None) {
                    error = Fail(t.line, "0 ENDSEC avant la section suivante");
                    return false;
                }
                wantSectionName = true;
            } else if (rec.type == "ENDSEC") {
                if (section == Section::None) {
                    error = Fail(t.line, "0 SECTION avant 0 ENDSEC");
                    return false;
                }
                section = Section::None;
            } else if (rec.type == "EOF") {
                if (section != Section::None) {
                    error = Fail(t.line, "0 ENDSEC avant 0 EOF");
                    return false;
                }
                rec.end = reader.offset();
                records.push_back(rec);
                cur = nullptr;
                break;
            } else {
                if (section == Section::None) {
                    error = Fail(t.line, "0 SECTION");
                    return false;
                }
                handleDone = false;
                isDimstyle = rec.type == "DIMSTYLE";
            }
            records.push_back(rec);
            cur = &records.back();
        } else if (cur == nullptr) {
            if (t.code != 999) {
                error = Fail(t.line, "0 SECTION");
                return false;
            }
        } else if (wantSectionName) {
            if (t.code != 2) {
                error = Fail(t.line, "le nom de la section (code 2)");
                return false;
            }
            section = SectionOf(TrimRight(t.value));
            cur->section = section;
            wantSectionName = false;
        } else if (t.code >= 1000) {
            if (!inXData) {
                if (t.code != 1001) {
                    error = Fail(t.line, "le code 1001 (nom d'application) avant les données étendues");
                    return false;
                }
                inXData = true;
            }
            if (!checker.Feed(t)) {
                error = Fail(t.line, checker.expected());
                return false;
            }
        } else {
            if (inXData) {
                if (!checker.Finish()) {
                    error = Fail(t.line, checker.expected());
                    return false;
                }
                inXData = false;
            }
            if (!handleDone && (t.code == 5 || (t.code == 105 && isDimstyle))) {
                const auto h = ParseHandle(t.value);
                if (!h || *h == 0) {
                    error = Fail(t.line + 1, "un identifiant hexadécimal non nul");
                    return false;
                }
                cur->handle = *h;
                handleDone = true;
            }
        }
        tagStart = reader.offset();
    }
    if (reader.failed()) {
        error = Fail(reader.errorLine(), reader.expected());
        return false;
    }
    if (records.empty() || records.back().type != "EOF") {
        error = Fail(reader.line(), "0 EOF en fin de fichier (fichier tronqué ?)");
        return false;
    }
    return true;
}

bool DrawingFile::ReadStructure(std::string& error)
{
    std::string table;
    const std::string_view buf = source->view();
    for (std::size_t i = 0; i < records.size(); ++i) {
        Record& rec = records[i];
        if (rec.type == "SECTION") {
            if (rec.section == Section::Header)
                headerRecord = i;
            continue;
        }
        if (rec.section == Section::Tables) {
            if (rec.type == "TABLE") {
                if (!table.empty()) {
                    error = Fail(rec.line, "0 ENDTAB avant la table suivante");
                    return false;
                }
                TagReader r(buf.substr(0, rec.end), rec.begin, rec.line);
                Tag t;
                while (r.next(t))
                    if (t.code == 2) {
                        table = std::string(TrimRight(t.value));
                        break;
                    }
                if (table.empty()) {
                    error = Fail(rec.line, "le nom de la table (code 2)");
                    return false;
                }
                tableHandles[table] = rec.handle;
            } else if (rec.type == "ENDTAB") {
                if (table.empty()) {
                    error = Fail(rec.line, "0 TABLE avant 0 ENDTAB");
                    return false;
                }
                tableEnds[table] = i;
                table.clear();
            } else if (rec.type == "ENDSEC") {
                if (!table.empty()) {
                    error = Fail(rec.line, "0 ENDTAB avant la fin de la section");
                    return false;
                }
            } else if (table.empty()) {
                error = Fail(rec.line, "0 TABLE avant l'entrée de table");
                return false;
            } else if (rec.type == "LAYER") {
                layers.push_back(i);
            } else if (rec.type == "APPID") {
                apps.push_back(i);
            }
        } else if (rec.section == Section::Objects) {
            if (rec.type == "ENDSEC")
                objectsEnd = i;
            else if (rootDictionary == SIZE_MAX && IsDictionaryType(rec.type))
                rootDictionary = i;
        }
    }
    return true;
}

bool DrawingFile::ReadHeader(std::string& error)
{
    std::string_view codepage;
    acadver = "AC1009";  // a file without header is read as R12
    if (headerRecord != SIZE_MAX) {
        const Record& rec = records[headerRecord];
        const std::string_view buf = source->view();
        TagReader r(buf.substr(0, rec.end), rec.begin, rec.line);
        Tag t;
        r.next(t);  // 0 SECTION
        r.next(t);  // 2 HEADER
        std::string_view name;
        bool valueSeen = true;
        auto bad = [&](const char* expected) {
            error = Fail(t.line + 1, FormatString("%s pour %.*s", expected, static_cast<int>(name.size()), name.data()));
            return false;
        };
        // One reading per type of setting; a flag is set by any non-zero integer, as other
        // readers take it.
        auto read = [&](const VelHeaderVar& var, auto& field) {
            using Field = std::remove_reference_t<decltype(field)>;
            if constexpr (std::is_same_v<Field, std::string>) {
                field = std::string(t.value);  // decoded below, once the code page is known
            } else if constexpr (std::is_same_v<Field, double>) {
                const auto v = ParseReal(t.value);
                if (!v)
                    return bad("un nombre réel");
                field = *v;
            } else {
                const auto v = ParseInt(t.value);
                if (!v || (!std::is_same_v<Field, bool> && (*v < var.min || *v > var.max)))
                    return bad("un entier");
                field = static_cast<Field>(*v);
            }
            return true;
        };
        std::size_t tagStart = r.offset();
        while (r.next(t)) {
            if (t.code == 9) {
                if (!headerVars.empty())
                    headerVars.back().end = tagStart;
                name = TrimRight(t.value);
                headerVars.push_back({name, tagStart, rec.end});
                valueSeen = false;
            } else if (headerVars.empty()) {
                error = Fail(t.line, "le code 9 (nom de variable d'en-tête)");
                return false;
            } else if (!valueSeen) {
                valueSeen = true;
                bool ok = true;
                if (name == "$ACADVER")
                    acadver = std::string(TrimRight(t.value));
                else if (name == "$DWGCODEPAGE")
                    codepage = TrimRight(t.value);
                else if (name == "$HANDSEED") {
                    const auto h = ParseHandle(t.value);
                    if (!h)
                        return bad("un identifiant hexadécimal");
                    handseed = *h;
                } else {
                    velWalkHeaderVars(
                        [&](const VelHeaderVar& var, auto& field) {
                            if (ok && name == var.name)
                                ok = read(var, field);
                        },
                        settings);
                }
                if (!ok)
                    return false;
            }
            tagStart = r.offset();
        }
        if (r.failed()) {
            error = Fail(r.errorLine(), r.expected());
            return false;
        }
    }
    encoding = TextEncoding::For(acadver, codepage);
    settings.clayer = DecodeText(settings.clayer, encoding);
    fileSettings = settings;
    return true;
}

bool DrawingFile::IndexHandles(std::string& error)
{
    index.reserve(records.size());
    std::uint64_t maxHandle = 0;
    for (std::size_t i = 0; i < records.size(); ++i)
        if (records[i].handle != 0) {
            index.push_back({records[i].handle, static_cast<std::uint32_t>(i)});
            maxHandle = std::max(maxHandle, records[i].handle);
        }
    // Handles mostly rise through each section: merge the ascending runs rather than
    // sort from scratch, unless the file is too shuffled for that to pay.
    std::vector<std::size_t> runs{0};
    for (std::size_t k = 1; k < index.size() && runs.size() <= 64; ++k)
        if (index[k] < index[k - 1])
            runs.push_back(k);
    if (runs.size() > 64) {
        std::sort(index.begin(), index.end());
    } else {
        runs.push_back(index.size());
        while (runs.size() > 2) {
            std::vector<std::size_t> merged{0};
            for (std::size_t r = 0; r + 2 < runs.size(); r += 2) {
                std::inplace_merge(index.begin() + static_cast<std::ptrdiff_t>(runs[r]),
                                   index.begin() + static_cast<std::ptrdiff_t>(runs[r + 1]),
                                   index.begin() + static_cast<std::ptrdiff_t>(runs[r + 2]));
                merged.push_back(runs[r + 2]);
            }
            if (runs.size() % 2 == 0)  // an odd number of runs: the last one waits
                merged.push_back(runs.back());
            runs = std::move(merged);
        }
    }
    for (std::size_t k = 1; k < index.size(); ++k)
        if (index[k].first == index[k - 1].first) {
            const Record& a = records[std::min(index[k].second, index[k - 1].second)];
            const Record& b = records[std::max(index[k].second, index[k - 1].second)];
            error = Fail(b.line, FormatString("un identifiant unique (%s est déjà celui de la ligne %u)",
                                              FormatHandle(b.handle).c_str(), a.line));
            return false;
        }
    // maxHandle + 1 wraps to 0 when the file used the last handle: nothing can be added.
    nextHandle = maxHandle == UINT64_MAX ? 0 : std::max(handseed, maxHandle + 1);
    return true;
}

bool DrawingFile::CheckDictionaries(std::string& error)
{
    std::vector<std::size_t> dictionaries;
    for (std::size_t i = 0; i < records.size(); ++i)
        if (IsDictionaryType(records[i].type))
            dictionaries.push_back(i);
    // Every object the host needs at once is read now, so that a malformed one refuses
    // the file instead of going missing later.
    std::vector<std::size_t> eager = dictionaries;
    eager.insert(eager.end(), layers.begin(), layers.end());
    eager.insert(eager.end(), apps.begin(), apps.end());
    for (std::size_t i : eager) {
        ParseError pe;
        if (!ObjectAt(i, &pe)) {
            error = Fail(pe.line, pe.expected);
            return false;
        }
    }
    for (std::size_t i : dictionaries)
        for (const auto& e : objects[i]->body().entries)
            if (e.handle == 0 || FindFileRecord(e.handle) == SIZE_MAX) {
                error = Fail(e.line, FormatString("une entrée vers un objet du dessin (l'identifiant %s de « %s » "
                                                  "n'existe pas)",
                                                  FormatHandle(e.handle).c_str(), e.key.c_str()));
                return false;
            }
    // Depth-first walk over dictionary entries: 1 on the path, 2 done.
    std::vector<std::uint8_t> state(records.size(), 0);
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
            const auto& entries = objects[f.record]->body().entries;
            if (f.next == entries.size()) {
                state[f.record] = 2;
                stack.pop_back();
                continue;
            }
            const DictEntry& e = entries[f.next++];
            const std::size_t child = FindFileRecord(e.handle);
            if (!IsDictionaryType(records[child].type))
                continue;
            if (state[child] == 1) {
                error = Fail(e.line, FormatString("une entrée qui ne remonte pas à un dictionnaire parent (« %s » "
                                                  "ramène au dictionnaire de la ligne %u)",
                                                  e.key.c_str(), records[child].line));
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

bool DrawingFile::Load(AcDbDatabase& db, std::unique_ptr<Source> src, const std::string& name, std::string& error)
{
    auto file = std::make_unique<DrawingFile>(&db);
    file->source = std::move(src);
    file->fileName = name;
    if (IsBinaryDxf(file->source->view())) {
        std::string text;
        std::uint64_t group = 0;
        std::string expected;
        if (!BinaryToText(file->source->view(), text, file->wideCodes, group, expected)) {
            error = FormatString("« %s » (DXF binaire), groupe %llu : il fallait %s", name.c_str(),
                                 static_cast<unsigned long long>(group), expected.c_str());
            return false;
        }
        file->binary = true;
        file->source = std::make_unique<Source>();
        file->source->Own(std::move(text));
    }
    if (!file->Scan(error) || !file->ReadStructure(error) || !file->ReadHeader(error))
        return false;
    if (file->encoding.utf8) {
        const std::string_view buf = file->source->view();
        const std::size_t bad = FindInvalidUtf8(buf);
        if (bad != std::string_view::npos) {
            error = file->Fail(LineOfOffset(buf, bad), "un texte UTF-8 valide");
            return false;
        }
    }
    file->objects.resize(file->records.size());
    file->sourceCount = file->records.size();
    if (!file->IndexHandles(error) || !file->CheckDictionaries(error))
        return false;
    db.file_ = std::move(file);
    return true;
}

bool DrawingFile::Read(std::unique_ptr<Source> src, const std::string& name, std::unique_ptr<AcDbDatabase>& out,
                       std::string& error)
{
    std::unique_ptr<AcDbDatabase> db(new AcDbDatabase(AcDbDatabase::Tag{}));
    if (!Load(*db, std::move(src), name, error))
        return false;
    out = std::move(db);
    return true;
}

std::size_t DrawingFile::FindFileRecord(std::uint64_t handle) const
{
    const auto it = std::lower_bound(index.begin(), index.end(), std::pair<std::uint64_t, std::uint32_t>{handle, 0});
    return it != index.end() && it->first == handle ? it->second : SIZE_MAX;
}

std::size_t DrawingFile::FindRecord(std::uint64_t handle) const
{
    if (const std::size_t found = FindFileRecord(handle); found != SIZE_MAX)
        return found;
    const auto added = addedIndex.find(handle);
    if (added != addedIndex.end())
        return added->second;
    const auto madeUp = madeUpIndex.find(handle);
    return madeUp == madeUpIndex.end() ? SIZE_MAX : madeUp->second;
}

std::uint64_t DrawingFile::HandleOf(std::size_t record)
{
    if (records[record].handle != 0)
        return records[record].handle;
    const auto known = madeUpHandles.find(record);
    if (known != madeUpHandles.end())
        return known->second;
    if (nextHandle == 0)
        return 0;
    const std::uint64_t handle = nextHandle++;
    madeUpHandles[record] = handle;
    madeUpIndex[handle] = record;
    return handle;
}

AcDbObject* DrawingFile::ObjectAt(std::size_t record, ParseError* failure)
{
    if (record >= records.size())
        return nullptr;
    if (objects[record])
        return objects[record].get();
    const Record& rec = records[record];
    std::unique_ptr<AcDbObject> object;
    if (IsDictionaryType(rec.type))
        object = std::make_unique<AcDbDictionary>();
    else if (rec.type == "XRECORD")
        object = std::make_unique<AcDbXrecord>();
    else if (rec.type == "LAYER" && rec.section == Section::Tables)
        object = std::make_unique<AcDbLayerTableRecord>();
    else
        object = std::make_unique<AcDbObject>();
    ObjectBody& body = object->body();
    body = ObjectBody();
    ParseError pe;
    const std::string_view buf = source->view();
    if (!ParseObject(buf.substr(rec.begin, rec.end - rec.begin), rec.line, encoding, body, pe)) {
        if (failure)
            *failure = pe;
        return nullptr;
    }
    body.database = database;
    body.record = record;
    body.handle = HandleOf(record);
    objects[record] = std::move(object);
    return objects[record].get();
}

bool DrawingFile::AddRecord(std::unique_ptr<AcDbObject> object, std::size_t before, Section section,
                            std::uint64_t owner, bool withHandle)
{
    ObjectBody& body = object->body();
    Record rec;
    rec.added = true;
    rec.section = section;
    rec.line = 0;
    const std::size_t record = records.size();
    if (nextHandle == 0)
        return false;
    if (withHandle) {
        rec.handle = nextHandle++;
        addedIndex[rec.handle] = record;
    }
    body.database = database;
    body.record = record;
    body.owner = owner;
    body.dirty = true;
    std::vector<Tag> head;
    if (withHandle) {
        head.push_back({5, 0, body.keep(FormatHandle(rec.handle))});
        body.handleWritten = true;
        if (section == Section::Objects && owner != 0) {
            head.push_back({102, 0, "{ACAD_REACTORS"});
            head.push_back({330, 0, body.keep(FormatHandle(owner))});
            head.push_back({102, 0, "}"});
        }
        head.push_back({330, 0, body.keep(FormatHandle(owner))});
    }
    body.tags.insert(body.tags.begin() + 1, head.begin(), head.end());
    body.entryPos += head.size();
    records.push_back(rec);
    objects.push_back(std::move(object));
    records.back().type = objects.back()->body().type;
    objects.back()->body().handle = HandleOf(record);
    insertions[before].push_back(record);
    modified = true;
    return true;
}

bool DrawingFile::AddObject(AcDbObject* object, std::uint64_t owner, std::string& error)
{
    if (objectsEnd == SIZE_MAX) {
        error = FormatString("un dessin %s ne peut pas contenir d'objets non graphiques", acadver.c_str());
        return false;
    }
    if (nextHandle == 0) {
        error = "le dessin n'a plus d'identifiant libre";
        return false;
    }
    return AddRecord(std::unique_ptr<AcDbObject>(object), objectsEnd, Section::Objects, owner, true);
}

std::size_t DrawingFile::LayerRecord(const std::string& name) const
{
    for (std::size_t i : layers)
        if (EqualsNoCase(const_cast<DrawingFile*>(this)->RecordName(i), name))
            return i;
    return SIZE_MAX;
}

std::size_t DrawingFile::AppRecord(const std::string& name) const
{
    for (std::size_t i : apps)
        if (EqualsNoCase(const_cast<DrawingFile*>(this)->RecordName(i), name))
            return i;
    return SIZE_MAX;
}

std::string DrawingFile::RecordName(std::size_t record)
{
    AcDbObject* object = ObjectAt(record);
    return object ? DecodeText(TrimRight(FirstValue(object->body(), 2)), encoding) : std::string();
}

namespace {

std::unique_ptr<AcDbObject> NewTableRecord(const char* type, const char* subclass, bool r12,
                                           std::unique_ptr<AcDbObject> object)
{
    ObjectBody& body = object->body();
    body.tags.clear();
    body.type = type;
    body.tags.push_back({0, 0, type});
    if (!r12) {
        body.tags.push_back({100, 0, "AcDbSymbolTableRecord"});
        body.tags.push_back({100, 0, subclass});
    }
    body.entryPos = body.tags.size();
    return object;
}

}  // namespace

bool DrawingFile::AddLayer(const std::string& name, std::size_t& record, std::string& error)
{
    const auto end = tableEnds.find("LAYER");
    if (end == tableEnds.end()) {
        error = "le dessin n'a pas de table des calques";
        return false;
    }
    const bool r12 = acadver <= "AC1009";
    auto object = NewTableRecord("LAYER", "AcDbLayerTableRecord", r12, std::make_unique<AcDbLayerTableRecord>());
    ObjectBody& body = object->body();
    body.tags.push_back({2, 0, body.keep(EncodeText(name, encoding))});
    body.tags.push_back({70, 0, "0"});
    body.tags.push_back({62, 0, "7"});
    body.tags.push_back({6, 0, r12 ? "CONTINUOUS" : "Continuous"});
    body.entryPos = body.tags.size();
    record = records.size();
    if (!AddRecord(std::move(object), end->second, Section::Tables, tableHandles["LAYER"], !r12)) {
        error = "le dessin n'a plus d'identifiant libre";
        return false;
    }
    layers.push_back(record);
    return true;
}

bool DrawingFile::AddApp(const std::string& name, std::string& error)
{
    const auto end = tableEnds.find("APPID");
    if (end == tableEnds.end()) {
        error = "le dessin n'a pas de table des applications";
        return false;
    }
    const bool r12 = acadver <= "AC1009";
    auto object = NewTableRecord("APPID", "AcDbRegAppTableRecord", r12, std::make_unique<AcDbObject>());
    ObjectBody& body = object->body();
    body.tags.push_back({2, 0, body.keep(EncodeText(name, encoding))});
    body.tags.push_back({70, 0, "0"});
    body.entryPos = body.tags.size();
    const std::size_t record = records.size();
    if (!AddRecord(std::move(object), end->second, Section::Tables, tableHandles["APPID"], !r12)) {
        error = "le dessin n'a plus d'identifiant libre";
        return false;
    }
    apps.push_back(record);
    return true;
}

std::string DrawingFile::HeaderValue(std::string_view name, std::uint64_t seed) const
{
    std::string out;
    if (name == "$HANDSEED")
        AppendTag(out, 5, FormatHandle(seed), eol);
    velWalkHeaderVars(
        [&](const VelHeaderVar& var, const auto& field) {
            using Field = std::remove_cvref_t<decltype(field)>;
            if (name != var.name)
                return;
            if constexpr (std::is_same_v<Field, std::string>)
                AppendTag(out, var.code, EncodeText(field, encoding), eol);
            else if constexpr (std::is_same_v<Field, double>)
                AppendTag(out, var.code, FormatRealShortest(field), eol);
            else
                AppendTag(out, var.code, std::to_string(static_cast<int>(field)), eol);
        },
        settings);
    return out;
}

std::vector<std::string> DrawingFile::ChangedHeaderVars() const
{
    std::vector<std::string> changed;
    velWalkHeaderVars(
        [&](const VelHeaderVar& var, const auto& now, const auto& read) {
            if (now != read)
                changed.push_back(var.name);
        },
        settings, fileSettings);
    const bool hasSeed = std::any_of(headerVars.begin(), headerVars.end(),
                                     [](const HeaderVar& v) { return v.name == "$HANDSEED"; });
    // A seed the file left too low is raised only when something is written anyway, so
    // that a drawing saved without change stays byte for byte the same.
    const bool anyChange = !changed.empty() || !addedIndex.empty() ||
                           std::any_of(objects.begin(), objects.end(),
                                       [](const auto& o) { return o && o->body().dirty; });
    if (nextHandle > handseed && (hasSeed || !addedIndex.empty()) && anyChange)
        changed.push_back("$HANDSEED");
    return changed;
}

void DrawingFile::WriteHeader(Writer& w, const std::vector<std::string>& changed) const
{
    std::vector<bool> written(changed.size(), false);
    auto slot = [&](std::string_view name) -> int {
        for (std::size_t k = 0; k < changed.size(); ++k)
            if (changed[k] == name)
                return static_cast<int>(k);
        return -1;
    };
    auto newVar = [&](const std::string& name) {
        std::string& out = w.Buffer();
        AppendTag(out, 9, name, eol);
        out += HeaderValue(name, nextHandle);
    };
    if (headerRecord == SIZE_MAX) {
        // A file without header gets one, so that the settings are kept.
        std::string& out = w.Buffer();
        AppendTag(out, 0, "SECTION", eol);
        AppendTag(out, 2, "HEADER", eol);
        for (const auto& name : changed)
            newVar(name);
        AppendTag(w.Buffer(), 0, "ENDSEC", eol);
        return;
    }
    const Record& rec = records[headerRecord];
    const std::uint64_t varsBegin = headerVars.empty() ? rec.end : headerVars.front().begin;
    w.Raw(rec.begin, varsBegin);
    for (const auto& v : headerVars) {
        const int k = slot(v.name);
        if (k < 0) {
            w.Raw(v.begin, v.end);
            continue;
        }
        written[static_cast<std::size_t>(k)] = true;
        newVar(changed[static_cast<std::size_t>(k)]);
    }
    for (std::size_t k = 0; k < changed.size(); ++k)
        if (!written[k])
            newVar(changed[k]);
    w.Raw(headerVars.empty() ? rec.end : headerVars.back().end, rec.end);
}

bool DrawingFile::Write(const std::function<bool(std::string_view)>& sink, std::string& error)
{
    if (!binary)
        return WriteText(sink, error);
    std::string text;
    if (!WriteText(
            [&](std::string_view piece) {
                text.append(piece);
                return true;
            },
            error))
        return false;
    std::string bytes;
    if (!TextToBinary(text, wideCodes, bytes, error)) {
        error = "conversion en DXF binaire impossible, " + error;
        return false;
    }
    if (!sink(bytes)) {
        error = "écriture interrompue";
        return false;
    }
    return true;
}

bool DrawingFile::WriteText(const std::function<bool(std::string_view)>& sink, std::string& error)
{
    const std::string_view buf = source->view();
    Writer w(buf, sink);
    const std::vector<std::string> changed = ChangedHeaderVars();
    const bool header = !changed.empty();
    if (sourceCount > 0)
        w.Raw(0, records[0].begin);
    if (header && headerRecord == SIZE_MAX)
        WriteHeader(w, changed);
    for (std::size_t i = 0; i < sourceCount; ++i) {
        const auto ins = insertions.find(i);
        if (ins != insertions.end())
            for (std::size_t k : ins->second)
                WriteObject(objects[k]->body(), w.Buffer(), eol);
        const Record& rec = records[i];
        if (i == headerRecord && header)
            WriteHeader(w, changed);
        else if (objects[i] && objects[i]->body().dirty)
            WriteObject(objects[i]->body(), w.Buffer(), eol);
        else
            w.Raw(rec.begin, rec.end);
    }
    if (sourceCount > 0)
        w.Raw(records[sourceCount - 1].end, buf.size());
    if (!w.Finish()) {
        error = "écriture interrompue";
        return false;
    }
    return true;
}

}  // namespace vel::dxf
