// Cutting a drawing file into its records in one pass over its text, and checking the
// order of its sections and tables.
#include "host/dxf/sections.hpp"

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

} // namespace

bool Sections::Read(std::string_view text, ParseError& error)
{
    return Scan(text, error) && ReadStructure(text, error);
}

std::size_t Sections::Add(const Record& record)
{
    records_.push_back(record);
    return records_.size() - 1;
}

std::size_t Sections::TableEnd(const std::string& table) const
{
    const auto it = tableEnds_.find(table);
    return it == tableEnds_.end() ? SIZE_MAX : it->second;
}

std::uint64_t Sections::TableHandle(const std::string& table) const
{
    const auto it = tableHandles_.find(table);
    return it == tableHandles_.end() ? 0 : it->second;
}

bool Sections::Scan(std::string_view buf, ParseError& error)
{
    if (buf.substr(0, 18) == "AutoCAD Binary DXF") {
        error = {1, "la signature complète du DXF binaire"};
        return false;
    }
    std::size_t start = buf.substr(0, 3) == "\xEF\xBB\xBF" ? 3 : 0;
    const std::size_t firstNl = buf.find('\n');
    eol_ = firstNl != std::string_view::npos && firstNl > 0 && buf[firstNl - 1] == '\r' ? "\r\n" : "\n";

    TagReader reader(buf, start, 1);
    records_.reserve(buf.size() / 96 + 16);
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
                    error = {t.line, checker.expected()};
                    return false;
                }
                inXData = false;
            }
            if (wantSectionName) {
                error = {t.line, "le nom de la section (code 2)"};
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
                    error = {t.line, "0 ENDSEC avant la section suivante"};
                    return false;
                }
                wantSectionName = true;
            } else if (rec.type == "ENDSEC") {
                if (section == Section::None) {
                    error = {t.line, "0 SECTION avant 0 ENDSEC"};
                    return false;
                }
                section = Section::None;
            } else if (rec.type == "EOF") {
                if (section != Section::None) {
                    error = {t.line, "0 ENDSEC avant 0 EOF"};
                    return false;
                }
                rec.end = reader.offset();
                records_.push_back(rec);
                cur = nullptr;
                break;
            } else {
                if (section == Section::None) {
                    error = {t.line, "0 SECTION"};
                    return false;
                }
                handleDone = false;
                isDimstyle = rec.type == "DIMSTYLE";
            }
            records_.push_back(rec);
            cur = &records_.back();
        } else if (cur == nullptr) {
            if (t.code != 999) {
                error = {t.line, "0 SECTION"};
                return false;
            }
        } else if (wantSectionName) {
            if (t.code != 2) {
                error = {t.line, "le nom de la section (code 2)"};
                return false;
            }
            section = SectionOf(TrimRight(t.value));
            cur->section = section;
            wantSectionName = false;
        } else if (t.code >= 1000) {
            if (!inXData) {
                if (t.code != 1001) {
                    error = {t.line, "le code 1001 (nom d'application) avant les données étendues"};
                    return false;
                }
                inXData = true;
            }
            if (!checker.Feed(t)) {
                error = {t.line, checker.expected()};
                return false;
            }
        } else {
            if (inXData) {
                if (!checker.Finish()) {
                    error = {t.line, checker.expected()};
                    return false;
                }
                inXData = false;
            }
            if (!handleDone && (t.code == 5 || (t.code == 105 && isDimstyle))) {
                const auto h = ParseHandle(t.value);
                if (!h || *h == 0) {
                    error = {t.line + 1, "un identifiant hexadécimal non nul"};
                    return false;
                }
                cur->handle = *h;
                handleDone = true;
            }
        }
        tagStart = reader.offset();
    }
    if (reader.failed()) {
        error = {reader.errorLine(), reader.expected()};
        return false;
    }
    if (records_.empty() || records_.back().type != "EOF") {
        error = {reader.line(), "0 EOF en fin de fichier (fichier tronqué ?)"};
        return false;
    }
    return true;
}

bool Sections::ReadStructure(std::string_view buf, ParseError& error)
{
    std::string table;
    for (std::size_t i = 0; i < records_.size(); ++i) {
        Record& rec = records_[i];
        if (rec.type == "SECTION") {
            if (rec.section == Section::Header)
                header_ = i;
            continue;
        }
        if (rec.section == Section::Tables) {
            if (rec.type == "TABLE") {
                if (!table.empty()) {
                    error = {rec.line, "0 ENDTAB avant la table suivante"};
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
                    error = {rec.line, "le nom de la table (code 2)"};
                    return false;
                }
                tableHandles_[table] = rec.handle;
            } else if (rec.type == "ENDTAB") {
                if (table.empty()) {
                    error = {rec.line, "0 TABLE avant 0 ENDTAB"};
                    return false;
                }
                tableEnds_[table] = i;
                table.clear();
            } else if (rec.type == "ENDSEC") {
                if (!table.empty()) {
                    error = {rec.line, "0 ENDTAB avant la fin de la section"};
                    return false;
                }
            } else if (table.empty()) {
                error = {rec.line, "0 TABLE avant l'entrée de table"};
                return false;
            } else if (rec.type == "LAYER") {
                layers_.push_back(i);
            } else if (rec.type == "APPID") {
                apps_.push_back(i);
            }
        } else if (rec.section == Section::Objects) {
            if (rec.type == "ENDSEC")
                objectsEnd_ = i;
            else if (rootDictionary_ == SIZE_MAX && IsDictionaryType(rec.type))
                rootDictionary_ = i;
        }
    }
    return true;
}

} // namespace vel::dxf
