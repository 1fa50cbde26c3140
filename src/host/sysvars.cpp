// System variables: those the host keeps (CMDECHO, UCSFOLLOW, AFLAGS, CPROFILE, the
// drawing's name) and those read from and written to the current drawing's header.
#include <cstring>
#include <filesystem>
#include <functional>
#include <map>
#include <type_traits>

#include "text/text.hpp"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/header_vars.h"
#include "velhost/profile.h"

namespace {

enum class Kind { Short, Real, String };

struct Value {
    Kind kind = Kind::Short;
    int integer = 0;
    double real = 0;
    std::string text;
};

struct SysVar {
    Kind kind;
    int min = 0;
    int max = 0;
    bool readOnly = false;
    std::function<bool(Value&)> get; // false: no value now (no drawing)
    std::function<bool(const Value&, std::string&)> set;
};

std::map<std::string, int>& HostShorts()
{
    static auto* values = new std::map<std::string, int>{{"CMDECHO", 1}, {"UCSFOLLOW", 0}, {"AFLAGS", 0}};
    return *values;
}

AcDbDatabase* Db()
{
    return acdbHostApplicationServices()->workingDatabase();
}

SysVar HostShort(const char* name, int min, int max)
{
    SysVar v{Kind::Short, min, max, false, {}, {}};
    v.get = [name](Value& out) {
        out.integer = HostShorts()[name];
        return true;
    };
    v.set = [name](const Value& in, std::string&) {
        HostShorts()[name] = in.integer;
        return true;
    };
    return v;
}

SysVar ReadOnlyText(std::function<std::string()> text)
{
    SysVar v{Kind::String, 0, 0, true, {}, {}};
    v.get = [text](Value& out) {
        out.text = text();
        return true;
    };
    return v;
}

// A header setting of the current drawing, read and set through the table's walk: a
// number for a number, a layer name for the current layer, a colour for the colour.
SysVar DbVar(const VelHeaderVar& var, Kind kind)
{
    const std::string name(var.name);
    SysVar v{kind, var.min, var.max, false, {}, {}};
    v.get = [name](Value& out) {
        if (Db() == nullptr)
            return false;
        const VelHeaderSettings& settings = Db()->headerSettings();
        velWalkHeaderVars(
            [&](const VelHeaderVar& row, const auto& field) {
                using Field = std::remove_cvref_t<decltype(field)>;
                if (name != row.name)
                    return;
                if constexpr (std::is_same_v<Field, std::string>)
                    out.text = Db()->layerName(Db()->clayer());
                else if constexpr (std::is_same_v<Field, double>)
                    out.real = field;
                else if (row.code == 62) {
                    const AcCmColor c = Db()->cecolor();
                    out.text = c.isByLayer() ? "DUCALQUE" : c.isByBlock() ? "DUBLOC" : FormatInt(c.colorIndex());
                } else
                    out.integer = static_cast<int>(field);
            },
            settings);
        return true;
    };
    v.set = [name, code = var.code](const Value& in, std::string& error) {
        if (Db() == nullptr) {
            error = "Aucun dessin ouvert.";
            return false;
        }
        VelHeaderSettings settings = Db()->headerSettings();
        bool understood = true;
        velWalkHeaderVars(
            [&](const VelHeaderVar& row, auto& field) {
                using Field = std::remove_cvref_t<decltype(field)>;
                if (name != row.name)
                    return;
                if constexpr (std::is_same_v<Field, std::string>) {
                    field = in.text;
                } else if constexpr (std::is_same_v<Field, double>) {
                    field = in.real;
                } else if (row.code == 62) {
                    const std::optional<long long> index = ParseInt(in.text);
                    if (EqualsNoCase(in.text, "DUCALQUE") || EqualsNoCase(in.text, "BYLAYER"))
                        field = AcCmColor::kByLayer;
                    else if (EqualsNoCase(in.text, "DUBLOC") || EqualsNoCase(in.text, "BYBLOCK"))
                        field = AcCmColor::kByBlock;
                    else if (index && *index >= 1 && *index <= 255)
                        field = static_cast<Field>(*index);
                    else
                        understood = false;
                } else {
                    field = static_cast<Field>(in.integer);
                }
            },
            settings);
        const Acad::ErrorStatus status = understood ? Db()->setHeaderSettings(settings) : Acad::eInvalidInput;
        if (status == Acad::eOk)
            return true;
        if (code == 8)
            error = FormatString("Le calque \"%s\" n'existe pas.", in.text.c_str());
        else if (code == 62)
            error = "Couleur attendue : 1 à 255, DUCALQUE ou DUBLOC.";
        else
            error = FormatString("Valeur refusée par le dessin (%s).", acadErrorStatusText(status));
        return false;
    };
    return v;
}

std::map<std::string, SysVar>& Table()
{
    static auto* table = [] {
        auto* t = new std::map<std::string, SysVar>;
        (*t)["CMDECHO"] = HostShort("CMDECHO", 0, 1);
        (*t)["UCSFOLLOW"] = HostShort("UCSFOLLOW", 0, 1);
        (*t)["AFLAGS"] = HostShort("AFLAGS", 0, 127);
        (*t)["CPROFILE"] = ReadOnlyText([] { return velHostSettings().profileName; });
        (*t)["DWGNAME"] = ReadOnlyText([] {
            AcApDocument* doc = acDocManagerPtr()->curDocument();
            return doc ? doc->docTitle() : std::string();
        });
        (*t)["DWGPREFIX"] = ReadOnlyText([] {
            AcApDocument* doc = acDocManagerPtr()->curDocument();
            if (doc == nullptr || doc->fileName().empty())
                return std::filesystem::current_path().string() + "/";
            return std::filesystem::path(doc->fileName()).parent_path().string() + "/";
        });
        const VelHeaderSettings defaults;
        velWalkHeaderVars(
            [t](const VelHeaderVar& var, const auto& field) {
                using Field = std::remove_cvref_t<decltype(field)>;
                const Kind kind = std::is_same_v<Field, double>                          ? Kind::Real
                                  : std::is_same_v<Field, std::string> || var.code == 62 ? Kind::String
                                                                                         : Kind::Short;
                (*t)[std::string(var.sysvar())] = DbVar(var, kind);
            },
            defaults);
        return t;
    }();
    return *table;
}

SysVar* Find(const std::string& name)
{
    std::string upper = name;
    for (char& c : upper)
        if (c >= 'a' && c <= 'z')
            c = static_cast<char>(c - 'a' + 'A');
    auto it = Table().find(upper);
    return it == Table().end() ? nullptr : &it->second;
}

// Stores a text in a buffer the way the result-buffer functions own theirs.
void PutText(resbuf* rb, const std::string& text)
{
    resbuf* tmp = velRbString(RTSTR, text);
    rb->restype = RTSTR;
    rb->resval.rstring = tmp->resval.rstring;
    tmp->resval.rstring = nullptr;
    acutRelRb(tmp);
}

int Set(SysVar& var, const std::string& name, Value value, std::string& error)
{
    if (var.readOnly) {
        error = FormatString("La variable %s est en lecture seule.", name.c_str());
        return RTERROR;
    }
    if (var.kind == Kind::Short && (value.integer < var.min || value.integer > var.max)) {
        error = FormatString("La variable %s attend une valeur de %d à %d.", name.c_str(), var.min, var.max);
        return RTERROR;
    }
    return var.set(value, error) ? RTNORM : RTERROR;
}

} // namespace

int acedGetVar(const char* name, resbuf* result)
{
    if (name == nullptr || result == nullptr)
        return RTERROR;
    SysVar* var = Find(name);
    Value value;
    if (var == nullptr || !var->get(value))
        return RTERROR;
    result->rbnext = nullptr;
    switch (var->kind) {
    case Kind::Short:
        result->restype = RTSHORT;
        result->resval.rint = static_cast<short>(value.integer);
        break;
    case Kind::Real:
        result->restype = RTREAL;
        result->resval.rreal = value.real;
        break;
    case Kind::String:
        PutText(result, value.text);
        break;
    }
    return RTNORM;
}

int acedSetVar(const char* name, const resbuf* value)
{
    if (name == nullptr || value == nullptr)
        return RTERROR;
    SysVar* var = Find(name);
    if (var == nullptr)
        return RTERROR;
    Value v;
    switch (var->kind) {
    case Kind::Short:
        if (value->restype == RTSHORT)
            v.integer = value->resval.rint;
        else if (value->restype == RTLONG)
            v.integer = value->resval.rlong;
        else
            return RTERROR;
        break;
    case Kind::Real:
        if (value->restype == RTREAL || value->restype == RTANG)
            v.real = value->resval.rreal;
        else if (value->restype == RTSHORT)
            v.real = value->resval.rint;
        else
            return RTERROR;
        break;
    case Kind::String:
        if (value->restype != RTSTR || value->resval.rstring == nullptr)
            return RTERROR;
        v.text = value->resval.rstring;
        break;
    }
    std::string error;
    return Set(*var, name, v, error);
}

void velRbClear(resbuf* rb)
{
    if (rb == nullptr)
        return;
    if (velRbKind(rb->restype) == VelRbKind::String && rb->resval.rstring != nullptr) {
        // Freed the way the result-buffer functions free their own texts.
        resbuf* holder = acutNewRb(RTNONE);
        holder->restype = RTSTR;
        holder->resval.rstring = rb->resval.rstring;
        rb->resval.rstring = nullptr;
        acutRelRb(holder);
    }
    rb->restype = RTNONE;
}

std::vector<std::string> velSysVarNames()
{
    std::vector<std::string> names;
    for (const auto& [name, var] : Table())
        names.push_back(name);
    return names;
}

std::string velSysVarText(const std::string& name)
{
    SysVar* var = Find(name);
    Value value;
    if (var == nullptr || !var->get(value))
        return {};
    switch (var->kind) {
    case Kind::Short:
        return FormatInt(value.integer);
    case Kind::Real:
        return FormatRealShortest(value.real);
    case Kind::String:
        return value.text;
    }
    return {};
}

int velSetSysVarText(const std::string& name, const std::string& text, std::string& error)
{
    SysVar* var = Find(name);
    if (var == nullptr) {
        error = FormatString("Variable inconnue \"%s\".", name.c_str());
        return RTERROR;
    }
    Value value;
    switch (var->kind) {
    case Kind::Short: {
        std::optional<long long> n = ParseInt(text);
        if (!n) {
            error = FormatString("La variable %s attend un nombre entier, pas \"%s\".", name.c_str(), text.c_str());
            return RTERROR;
        }
        if (*n < var->min || *n > var->max) {
            error = FormatString("La variable %s attend une valeur de %d à %d.", name.c_str(), var->min, var->max);
            return RTERROR;
        }
        value.integer = static_cast<int>(*n);
        break;
    }
    case Kind::Real: {
        std::optional<double> r = ParseReal(text);
        if (!r) {
            error = FormatString("La variable %s attend un nombre, pas \"%s\".", name.c_str(), text.c_str());
            return RTERROR;
        }
        value.real = *r;
        break;
    }
    case Kind::String:
        value.text = text;
        break;
    }
    const int status = Set(*var, name, value, error);
    if (status != RTNORM && error.empty())
        error = FormatString("Valeur refusée pour %s.", name.c_str());
    return status;
}
