// Reading the HEADER section's variables (those of the header table by the table's walk)
// and writing the section back with only the changed ones written anew.
#include "host/dxf/header.hpp"

#include <algorithm>
#include <type_traits>

#include "text/text.hpp"

namespace vel::dxf {

bool Header::Read(std::string_view buf, const Record* section, ParseError& error)
{
    std::string_view codepage;
    if (section != nullptr) {
        const Record& rec = *section;
        TagReader r(buf.substr(0, rec.end), rec.begin, rec.line);
        Tag t;
        r.next(t); // 0 SECTION
        r.next(t); // 2 HEADER
        std::string_view name;
        bool valueSeen = true;
        auto bad = [&](const char* expected) {
            error = {t.line + 1, FormatString("%s pour %.*s", expected, static_cast<int>(name.size()), name.data())};
            return false;
        };
        // One reading per type of setting; a flag is set by any non-zero integer, as other
        // readers take it.
        auto read = [&](const VelHeaderVar& var, auto& field) {
            using Field = std::remove_reference_t<decltype(field)>;
            if constexpr (std::is_same_v<Field, std::string>) {
                field = std::string(t.value); // decoded below, once the code page is known
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
                if (!vars_.empty())
                    vars_.back().end = tagStart;
                name = TrimRight(t.value);
                vars_.push_back({name, tagStart, rec.end});
                valueSeen = false;
            } else if (vars_.empty()) {
                error = {t.line, "le code 9 (nom de variable d'en-tête)"};
                return false;
            } else if (!valueSeen) {
                valueSeen = true;
                bool ok = true;
                if (name == "$ACADVER")
                    acadver_ = std::string(TrimRight(t.value));
                else if (name == "$DWGCODEPAGE")
                    codepage = TrimRight(t.value);
                else if (name == "$HANDSEED") {
                    const auto h = ParseHandle(t.value);
                    if (!h)
                        return bad("un identifiant hexadécimal");
                    handseed_ = *h;
                } else {
                    velWalkHeaderVars(
                        [&](const VelHeaderVar& var, auto& field) {
                            if (ok && name == var.name)
                                ok = read(var, field);
                        },
                        settings_);
                }
                if (!ok)
                    return false;
            }
            tagStart = r.offset();
        }
        if (r.failed()) {
            error = {r.errorLine(), r.expected()};
            return false;
        }
    }
    encoding_ = TextEncoding::For(acadver_, codepage);
    settings_.clayer = DecodeText(settings_.clayer, encoding_);
    fileSettings_ = settings_;
    return true;
}

bool Header::HasSeed() const
{
    return std::any_of(vars_.begin(), vars_.end(), [](const HeaderVar& v) { return v.name == "$HANDSEED"; });
}

std::vector<std::string> Header::Changed() const
{
    std::vector<std::string> changed;
    velWalkHeaderVars(
        [&](const VelHeaderVar& var, const auto& now, const auto& read) {
            if (now != read)
                changed.push_back(var.name);
        },
        settings_, fileSettings_);
    return changed;
}

std::string Header::Value(std::string_view name, std::uint64_t seed, const std::string& eol) const
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
                AppendTag(out, var.code, EncodeText(field, encoding_), eol);
            else if constexpr (std::is_same_v<Field, double>)
                AppendTag(out, var.code, FormatRealShortest(field), eol);
            else
                AppendTag(out, var.code, std::to_string(static_cast<int>(field)), eol);
        },
        settings_);
    return out;
}

void Header::Write(Writer& w, const Record* section, const std::vector<std::string>& changed, std::uint64_t seed,
                   const std::string& eol) const
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
        out += Value(name, seed, eol);
    };
    if (section == nullptr) {
        // A file without header gets one, so that the settings are kept.
        std::string& out = w.Buffer();
        AppendTag(out, 0, "SECTION", eol);
        AppendTag(out, 2, "HEADER", eol);
        for (const auto& name : changed)
            newVar(name);
        AppendTag(w.Buffer(), 0, "ENDSEC", eol);
        return;
    }
    const Record& rec = *section;
    const std::uint64_t varsBegin = vars_.empty() ? rec.end : vars_.front().begin;
    w.Raw(rec.begin, varsBegin);
    for (const auto& v : vars_) {
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
    w.Raw(vars_.empty() ? rec.end : vars_.back().end, rec.end);
}

} // namespace vel::dxf
