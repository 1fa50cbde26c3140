// Reading one DXF object into its tags and the parts the host interprets, writing it
// back, and converting its XData and XRECORD data to and from result buffers.
#include "host/dxf/objects.hpp"

#include <algorithm>
#include <cstdlib>
#include <utility>

#include "text/text.hpp"

namespace vel::dxf {
namespace {

bool IsReal(std::string_view value)
{
    return ParseReal(value).has_value();
}

bool IntInRange(std::string_view value, long long low, long long high)
{
    const auto v = ParseInt(value);
    return v && *v >= low && *v <= high;
}

bool IsHex(std::string_view value, bool evenLength)
{
    value = TrimRight(value);
    if (evenLength && value.size() % 2 != 0)
        return false;
    for (char c : value)
        if (!((c >= '0' && c <= '9') || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F')))
            return false;
    return true;
}

std::string HexDecode(std::string_view hex)
{
    hex = TrimRight(hex);
    std::string out;
    auto digit = [](char c) { return c <= '9' ? c - '0' : (c | 0x20) - 'a' + 10; };
    for (std::size_t i = 0; i + 1 < hex.size(); i += 2)
        out.push_back(static_cast<char>(digit(hex[i]) * 16 + digit(hex[i + 1])));
    return out;
}

std::string HexEncode(std::string_view bytes)
{
    static const char kDigits[] = "0123456789ABCDEF";
    std::string out;
    for (char c : bytes) {
        const auto b = static_cast<unsigned char>(c);
        out.push_back(kDigits[b >> 4]);
        out.push_back(kDigits[b & 0xF]);
    }
    return out;
}

std::string AppName(std::string_view raw, const TextEncoding& encoding)
{
    return DecodeText(TrimRight(raw), encoding);
}

double RealOf(std::string_view value)
{
    return ParseReal(value).value_or(0.0);
}

// One result buffer from a tag (and, for a point, the two tags after it).
resbuf* RbFromTags(const std::vector<Tag>& tags, std::size_t& i, std::size_t end, const TextEncoding& encoding)
{
    const Tag& t = tags[i];
    const auto code = static_cast<short>(t.code);
    resbuf* rb = nullptr;
    switch (velRbKind(t.code)) {
    case VelRbKind::Point: {
        double xyz[3] = {RealOf(t.value), 0.0, 0.0};
        ++i;
        for (int axis = 1; axis < 3 && i < end && tags[i].code == t.code + 10 * axis; ++axis, ++i)
            xyz[axis] = RealOf(tags[i].value);
        return velRbPoint(code, xyz[0], xyz[1], xyz[2]);
    }
    case VelRbKind::Real:
        rb = velRbReal(code, RealOf(t.value));
        break;
    case VelRbKind::Short:
        rb = velRbShort(code, static_cast<short>(ParseInt(t.value).value_or(0)));
        break;
    case VelRbKind::Long:
        rb = velRbLong(code, static_cast<std::int32_t>(static_cast<std::uint32_t>(ParseInt(t.value).value_or(0))));
        break;
    case VelRbKind::Binary:
        rb = velRbBinary(HexDecode(t.value));
        break;
    default:
        rb = velRbString(code, code == kXdRegAppName ? AppName(t.value, encoding) : DecodeText(t.value, encoding));
        break;
    }
    ++i;
    return rb;
}

// Tags of one result buffer, values kept in the body's storage.
bool TagsFromRb(ObjectBody& body, const resbuf* rb, const TextEncoding& encoding, std::vector<Tag>& out,
                std::string& error)
{
    const int code = rb->restype;
    switch (velRbKind(code)) {
    case VelRbKind::Point:
        for (int axis = 0; axis < 3; ++axis)
            out.push_back({code + 10 * axis, 0, body.keep(FormatRealShortest(rb->resval.rpoint[axis]))});
        return true;
    case VelRbKind::Real:
        out.push_back({code, 0, body.keep(FormatRealShortest(rb->resval.rreal))});
        return true;
    case VelRbKind::Short:
        out.push_back({code, 0, body.keep(std::to_string(rb->resval.rint))});
        return true;
    case VelRbKind::Long:
        out.push_back({code, 0, body.keep(std::to_string(rb->resval.rlong))});
        return true;
    case VelRbKind::Binary:
        out.push_back({code, 0,
                       body.keep(HexEncode(std::string_view(rb->resval.rbinary.buf ? rb->resval.rbinary.buf : "",
                                                            rb->resval.rbinary.buf && rb->resval.rbinary.clen > 0
                                                                ? static_cast<std::size_t>(rb->resval.rbinary.clen)
                                                                : 0)))});
        return true;
    case VelRbKind::String: {
        const std::string text = rb->resval.rstring ? rb->resval.rstring : "";
        if (text.find_first_of("\r\n") != std::string::npos) {
            error = FormatString("le texte du code %d contient un saut de ligne", code);
            return false;
        }
        out.push_back({code, 0, body.keep(EncodeText(text, encoding))});
        return true;
    }
    default:
        error = FormatString("type de valeur %d inconnu", code);
        return false;
    }
}

// Splits XData tags into application groups: [begin, end) per group.
std::vector<std::pair<std::size_t, std::size_t>> Groups(const std::vector<Tag>& xdata)
{
    std::vector<std::pair<std::size_t, std::size_t>> groups;
    for (std::size_t i = 0; i < xdata.size(); ++i) {
        if (xdata[i].code == kXdRegAppName) {
            if (!groups.empty())
                groups.back().second = i;
            groups.push_back({i, xdata.size()});
        }
    }
    return groups;
}

} // namespace

bool XDataChecker::Fail(std::string expected)
{
    expected_ = std::move(expected);
    return false;
}

bool XDataChecker::Feed(const Tag& t)
{
    if (pendingAxis_ != 0) {
        if (t.code != pendingAxis_)
            return Fail(FormatString("le code %d (coordonnée Y du point)", pendingAxis_));
        if (!IsReal(t.value))
            return Fail("un nombre réel");
        optionalAxis_ = pendingAxis_ + 10;
        pendingAxis_ = 0;
        return true;
    }
    if (optionalAxis_ != 0 && t.code == optionalAxis_) {
        optionalAxis_ = 0;
        return IsReal(t.value) ? true : Fail("un nombre réel");
    }
    optionalAxis_ = 0;
    switch (t.code) {
    case 1001:
        if (depth_ != 0)
            return Fail("« } » avant l'application suivante (code 1002)");
        return true;
    case 1000:
    case 1003:
        return true;
    case 1005:
        return IsHex(t.value, false) && !TrimRight(t.value).empty() ? true : Fail("un identifiant hexadécimal");
    case 1004:
        return IsHex(t.value, true) ? true : Fail("des octets en hexadécimal");
    case 1002: {
        const auto v = TrimRight(t.value);
        if (v == "{") {
            ++depth_;
            return true;
        }
        if (v == "}") {
            if (depth_ == 0)
                return Fail("« { » avant « } » (code 1002)");
            --depth_;
            return true;
        }
        return Fail("« { » ou « } » (code 1002)");
    }
    case 1010:
    case 1011:
    case 1012:
    case 1013:
        pendingAxis_ = t.code + 10;
        return IsReal(t.value) ? true : Fail("un nombre réel");
    case 1040:
    case 1041:
    case 1042:
        return IsReal(t.value) ? true : Fail("un nombre réel");
    case 1070:
        return IntInRange(t.value, -32768, 32767) ? true : Fail("un entier de 16 bits");
    case 1071:
        return IntInRange(t.value, -2147483648LL, 4294967295LL) ? true : Fail("un entier de 32 bits");
    default:
        return Fail("un code de données étendues (1000 à 1071)");
    }
}

bool XDataChecker::Finish()
{
    if (pendingAxis_ != 0)
        return Fail(FormatString("le code %d (coordonnée Y du point)", pendingAxis_));
    if (depth_ != 0)
        return Fail("« } » fermant le groupe (code 1002)");
    optionalAxis_ = 0;
    return true;
}

bool IsDictionaryType(std::string_view type)
{
    return type == "DICTIONARY" || type == "ACDBDICTIONARYWDFLT";
}

bool ParseObject(std::string_view bytes, std::uint32_t firstLine, const TextEncoding& encoding, ObjectBody& body,
                 ParseError& error)
{
    TagReader reader(bytes, 0, firstLine);
    Tag t;
    bool first = true;
    bool inXData = false;
    bool afterXData = false;
    bool inDictPart = true;
    bool in102 = false;
    XDataChecker checker;
    auto fail = [&](std::uint32_t line, std::string expected) {
        error.line = line;
        error.expected = std::move(expected);
        return false;
    };
    while (reader.next(t)) {
        if (first) {
            body.type = std::string(TrimRight(t.value));
            body.isDictionary = IsDictionaryType(body.type);
            body.tags.push_back(t);
            first = false;
            continue;
        }
        if (!afterXData && (inXData || t.code == 1001)) {
            if (t.code >= 1000) {
                inXData = true;
                if (!checker.Feed(t))
                    return fail(t.line, checker.expected());
                body.xdata.push_back(t);
                continue;
            }
            if (!checker.Finish())
                return fail(t.line, checker.expected());
            inXData = false;
            afterXData = true;
        }
        if (afterXData) {
            body.tail.push_back(t);
            continue;
        }
        if (t.code >= 1000)
            return fail(t.line, "le code 1001 (nom d'application) avant les données étendues");
        if (t.code == 102) {
            in102 = !t.value.empty() && t.value.front() == '{';
        } else if (!body.handleWritten && (t.code == 5 || (t.code == 105 && body.type == "DIMSTYLE"))) {
            const auto h = ParseHandle(t.value);
            if (!h || *h == 0)
                return fail(t.line, "un identifiant hexadécimal non nul");
            body.handle = *h;
            body.handleWritten = true;
        } else if (t.code == 330 && !in102 && body.owner == 0) {
            const auto h = ParseHandle(t.value);
            if (!h)
                return fail(t.line, "un identifiant hexadécimal");
            body.owner = *h;
        } else if (body.isDictionary) {
            if (t.code == 100) {
                inDictPart = TrimRight(t.value) == "AcDbDictionary";
            } else if (t.code == 280 && inDictPart) {
                body.hardOwner = TrimRight(t.value) == "1";
            } else if (t.code == 3 && inDictPart) {
                Tag ref;
                if (!reader.next(ref))
                    return fail(reader.failed() ? reader.errorLine() : t.line + 2,
                                reader.failed() ? reader.expected() : "le code 350 ou 360 de l'entrée");
                if (ref.code != 350 && ref.code != 360)
                    return fail(ref.line, "le code 350 ou 360 de l'entrée de dictionnaire");
                const auto h = ParseHandle(ref.value);
                if (!h)
                    return fail(ref.line, "un identifiant hexadécimal");
                if (body.entries.empty())
                    body.entryPos = body.tags.size();
                body.entries.push_back({DecodeText(t.value, encoding), t.value, *h, ref.code, ref.line});
                continue;
            }
        }
        body.tags.push_back(t);
    }
    if (reader.failed())
        return fail(reader.errorLine(), reader.expected());
    if (inXData && !checker.Finish())
        return fail(body.xdata.back().line, checker.expected());
    if (body.entries.empty())
        body.entryPos = body.tags.size();
    return true;
}

void WriteObject(const ObjectBody& body, std::string& out, std::string_view eol)
{
    for (std::size_t i = 0; i <= body.tags.size(); ++i) {
        if (i == body.entryPos)
            for (const auto& e : body.entries) {
                AppendTag(out, 3, e.rawKey, eol);
                AppendTag(out, e.code, FormatHandle(e.handle), eol);
            }
        if (i < body.tags.size())
            AppendTag(out, body.tags[i].code, body.tags[i].value, eol);
    }
    for (const auto& t : body.xdata)
        AppendTag(out, t.code, t.value, eol);
    for (const auto& t : body.tail)
        AppendTag(out, t.code, t.value, eol);
}

resbuf* XDataToRb(const std::vector<Tag>& xdata, std::string_view app, const TextEncoding& encoding)
{
    VelRbBuilder list;
    for (const auto& [begin, end] : Groups(xdata)) {
        if (!app.empty() && !EqualsNoCase(AppName(xdata[begin].value, encoding), app))
            continue;
        for (std::size_t i = begin; i < end;)
            list.add(RbFromTags(xdata, i, end, encoding));
    }
    return list.release();
}

std::vector<std::string> XDataApps(const std::vector<Tag>& xdata, const TextEncoding& encoding)
{
    std::vector<std::string> apps;
    for (const auto& g : Groups(xdata))
        apps.push_back(AppName(xdata[g.first].value, encoding));
    return apps;
}

bool MergeXData(ObjectBody& body, const resbuf* list, const TextEncoding& encoding, std::vector<std::string>& apps,
                std::string& error)
{
    if (list == nullptr || list->restype != kXdRegAppName) {
        error = "la liste doit commencer par le nom d'application (code 1001)";
        return false;
    }
    // Build and check the new groups before touching the object.
    std::vector<std::pair<std::string, std::vector<Tag>>> incoming;
    XDataChecker checker;
    for (const resbuf* rb = list; rb; rb = rb->rbnext) {
        if (rb->restype < 1000 || rb->restype > 1071) {
            error = FormatString("code de données étendues %d inattendu", rb->restype);
            return false;
        }
        if (rb->restype == kXdRegAppName) {
            const std::string name = rb->resval.rstring ? rb->resval.rstring : "";
            if (name.empty() || name.find_first_of("\r\n") != std::string::npos) {
                error = "nom d'application vide ou invalide";
                return false;
            }
            incoming.push_back({name, {}});
        }
        std::vector<Tag> tags;
        if (!TagsFromRb(body, rb, encoding, tags, error))
            return false;
        for (const Tag& t : tags)
            if (!checker.Feed(t)) {
                error = "données étendues incorrectes : il fallait " + checker.expected();
                return false;
            }
        incoming.back().second.insert(incoming.back().second.end(), tags.begin(), tags.end());
    }
    if (!checker.Finish()) {
        error = "données étendues incorrectes : il fallait " + checker.expected();
        return false;
    }
    std::vector<std::pair<std::string, std::vector<Tag>>> groups;
    for (const auto& [begin, end] : Groups(body.xdata))
        groups.push_back({AppName(body.xdata[begin].value, encoding),
                          std::vector<Tag>(body.xdata.begin() + static_cast<std::ptrdiff_t>(begin),
                                           body.xdata.begin() + static_cast<std::ptrdiff_t>(end))});
    for (auto& [name, tags] : incoming) {
        apps.push_back(name);
        auto it = groups.begin();
        while (it != groups.end() && !EqualsNoCase(it->first, name))
            ++it;
        const bool remove = tags.size() == 1;
        if (it == groups.end()) {
            if (!remove)
                groups.push_back({name, std::move(tags)});
        } else if (remove) {
            groups.erase(it);
        } else {
            it->second = std::move(tags);
        }
    }
    body.xdata.clear();
    for (auto& g : groups)
        body.xdata.insert(body.xdata.end(), g.second.begin(), g.second.end());
    body.dirty = true;
    return true;
}

namespace {

// Index of the first data tag of an XRECORD (after the marker and the cloning flag).
std::size_t XrecordDataStart(const ObjectBody& body)
{
    for (std::size_t i = 0; i < body.tags.size(); ++i)
        if (body.tags[i].code == 100 && TrimRight(body.tags[i].value) == "AcDbXrecord") {
            std::size_t start = i + 1;
            if (start < body.tags.size() && body.tags[start].code == 280)
                ++start;
            return start;
        }
    return body.tags.size();
}

} // namespace

resbuf* XrecordToRb(const ObjectBody& body, const TextEncoding& encoding)
{
    VelRbBuilder list;
    const std::size_t end = body.tags.size();
    for (std::size_t i = XrecordDataStart(body); i < end;)
        list.add(RbFromTags(body.tags, i, end, encoding));
    return list.release();
}

bool SetXrecordData(ObjectBody& body, const resbuf* list, const TextEncoding& encoding, std::string& error)
{
    std::vector<Tag> tags;
    for (const resbuf* rb = list; rb; rb = rb->rbnext) {
        if (rb->restype <= 0 || rb->restype == 5 || rb->restype == 100 || rb->restype == 102 || rb->restype >= 1000) {
            error = FormatString("code %d interdit dans les données d'un XRECORD", rb->restype);
            return false;
        }
        if (!TagsFromRb(body, rb, encoding, tags, error))
            return false;
    }
    std::size_t start = XrecordDataStart(body);
    if (start == body.tags.size() && (body.tags.empty() || body.tags.back().code != 280) &&
        std::none_of(body.tags.begin(), body.tags.end(),
                     [](const Tag& t) { return t.code == 100 && TrimRight(t.value) == "AcDbXrecord"; })) {
        body.tags.push_back({100, 0, "AcDbXrecord"});
        start = body.tags.size();
    }
    body.tags.resize(start);
    body.tags.insert(body.tags.end(), tags.begin(), tags.end());
    body.entryPos = body.tags.size();
    body.dirty = true;
    return true;
}

std::string_view FirstValue(const ObjectBody& body, int code)
{
    for (const auto& t : body.tags)
        if (t.code == code)
            return t.value;
    return {};
}

} // namespace vel::dxf
