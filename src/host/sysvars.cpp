// System variables: those the host keeps (CMDECHO, UCSFOLLOW, AFLAGS, CPROFILE, the
// drawing's name) and those read from and written to the current drawing's header.
#include <cstring>
#include <filesystem>
#include <functional>
#include <map>

#include "text/text.hpp"
#include "velhost/documents.h"
#include "velhost/editor.h"
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
  std::function<bool(Value&)> get;               // false: no value now (no drawing)
  std::function<bool(const Value&, std::string&)> set;
};

std::map<std::string, int>& HostShorts() {
  static auto* values = new std::map<std::string, int>{{"CMDECHO", 1}, {"UCSFOLLOW", 0}, {"AFLAGS", 0}};
  return *values;
}

AcDbDatabase* Db() { return acdbHostApplicationServices()->workingDatabase(); }

SysVar HostShort(const char* name, int min, int max) {
  SysVar v{Kind::Short, min, max, false, {}, {}};
  v.get = [name](Value& out) { out.integer = HostShorts()[name]; return true; };
  v.set = [name](const Value& in, std::string&) { HostShorts()[name] = in.integer; return true; };
  return v;
}

SysVar ReadOnlyText(std::function<std::string()> text) {
  SysVar v{Kind::String, 0, 0, true, {}, {}};
  v.get = [text](Value& out) { out.text = text(); return true; };
  return v;
}

// A header setting of the current drawing kept as a 16-bit value.
SysVar DbShort(int min, int max, std::function<int(AcDbDatabase&)> get,
               std::function<Acad::ErrorStatus(AcDbDatabase&, int)> set) {
  SysVar v{Kind::Short, min, max, false, {}, {}};
  v.get = [get](Value& out) {
    if (Db() == nullptr) return false;
    out.integer = get(*Db());
    return true;
  };
  v.set = [set](const Value& in, std::string& error) {
    if (Db() == nullptr) {
      error = "Aucun dessin ouvert.";
      return false;
    }
    const Acad::ErrorStatus status = set(*Db(), in.integer);
    if (status != Acad::eOk) error = FormatString("Valeur refusée par le dessin (%s).", acadErrorStatusText(status));
    return status == Acad::eOk;
  };
  return v;
}

std::map<std::string, SysVar>& Table() {
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
      if (doc == nullptr || doc->fileName().empty()) return std::filesystem::current_path().string() + "/";
      return std::filesystem::path(doc->fileName()).parent_path().string() + "/";
    });
    (*t)["AUNITS"] = DbShort(0, 4, [](AcDbDatabase& d) { return int(d.aunits()); },
                            [](AcDbDatabase& d, int v) { return d.setAunits(short(v)); });
    (*t)["ANGDIR"] = DbShort(0, 1, [](AcDbDatabase& d) { return int(d.angdir()); },
                            [](AcDbDatabase& d, int v) { return d.setAngdir(v != 0); });
    (*t)["OSMODE"] = DbShort(0, 32767, [](AcDbDatabase& d) { return d.osmode(); },
                            [](AcDbDatabase& d, int v) { return d.setOsmode(v); });
    (*t)["ATTDIA"] = DbShort(0, 1, [](AcDbDatabase& d) { return int(d.attdia()); },
                            [](AcDbDatabase& d, int v) { return d.setAttdia(v != 0); });
    (*t)["ATTREQ"] = DbShort(0, 1, [](AcDbDatabase& d) { return int(d.attreq()); },
                            [](AcDbDatabase& d, int v) { return d.setAttreq(v != 0); });
    (*t)["LIMCHECK"] = DbShort(0, 1, [](AcDbDatabase& d) { return int(d.limcheck()); },
                              [](AcDbDatabase& d, int v) { return d.setLimcheck(v != 0); });
    (*t)["ORTHOMODE"] = DbShort(0, 1, [](AcDbDatabase& d) { return int(d.orthomode()); },
                               [](AcDbDatabase& d, int v) { return d.setOrthomode(v != 0); });
    SysVar angbase{Kind::Real, 0, 0, false, {}, {}};
    angbase.get = [](Value& out) {
      if (Db() == nullptr) return false;
      out.real = Db()->angbase();
      return true;
    };
    angbase.set = [](const Value& in, std::string& error) {
      if (Db() == nullptr) {
        error = "Aucun dessin ouvert.";
        return false;
      }
      return Db()->setAngbase(in.real) == Acad::eOk;
    };
    (*t)["ANGBASE"] = angbase;
    SysVar clayer{Kind::String, 0, 0, false, {}, {}};
    clayer.get = [](Value& out) {
      if (Db() == nullptr) return false;
      out.text = Db()->layerName(Db()->clayer());
      return true;
    };
    clayer.set = [](const Value& in, std::string& error) {
      AcDbObjectId id;
      if (Db() == nullptr || Db()->getLayerId(in.text, id) != Acad::eOk) {
        error = FormatString("Le calque \"%s\" n'existe pas.", in.text.c_str());
        return false;
      }
      return Db()->setClayer(id) == Acad::eOk;
    };
    (*t)["CLAYER"] = clayer;
    SysVar cecolor{Kind::String, 0, 0, false, {}, {}};
    cecolor.get = [](Value& out) {
      if (Db() == nullptr) return false;
      const AcCmColor c = Db()->cecolor();
      out.text = c.isByLayer() ? "DUCALQUE" : c.isByBlock() ? "DUBLOC" : FormatInt(c.colorIndex());
      return true;
    };
    cecolor.set = [](const Value& in, std::string& error) {
      AcCmColor c;
      std::optional<long long> index = ParseInt(in.text);
      Acad::ErrorStatus status = Acad::eInvalidInput;
      if (EqualsNoCase(in.text, "DUCALQUE") || EqualsNoCase(in.text, "BYLAYER"))
        status = c.setColorIndex(AcCmColor::kByLayer);
      else if (EqualsNoCase(in.text, "DUBLOC") || EqualsNoCase(in.text, "BYBLOCK"))
        status = c.setColorIndex(AcCmColor::kByBlock);
      else if (index && *index >= 1 && *index <= 255)
        status = c.setColorIndex(static_cast<short>(*index));
      if (status != Acad::eOk || Db() == nullptr || Db()->setCecolor(c) != Acad::eOk) {
        error = "Couleur attendue : 1 à 255, DUCALQUE ou DUBLOC.";
        return false;
      }
      return true;
    };
    (*t)["CECOLOR"] = cecolor;
    return t;
  }();
  return *table;
}

SysVar* Find(const std::string& name) {
  std::string upper = name;
  for (char& c : upper)
    if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
  auto it = Table().find(upper);
  return it == Table().end() ? nullptr : &it->second;
}

// Stores a text in a buffer the way the result-buffer functions own theirs.
void PutText(resbuf* rb, const std::string& text) {
  resbuf* tmp = velRbString(RTSTR, text);
  rb->restype = RTSTR;
  rb->resval.rstring = tmp->resval.rstring;
  tmp->resval.rstring = nullptr;
  acutRelRb(tmp);
}

int Set(SysVar& var, const std::string& name, Value value, std::string& error) {
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

}  // namespace

int acedGetVar(const char* name, resbuf* result) {
  if (name == nullptr || result == nullptr) return RTERROR;
  SysVar* var = Find(name);
  Value value;
  if (var == nullptr || !var->get(value)) return RTERROR;
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

int acedSetVar(const char* name, const resbuf* value) {
  if (name == nullptr || value == nullptr) return RTERROR;
  SysVar* var = Find(name);
  if (var == nullptr) return RTERROR;
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
      if (value->restype != RTSTR || value->resval.rstring == nullptr) return RTERROR;
      v.text = value->resval.rstring;
      break;
  }
  std::string error;
  return Set(*var, name, v, error);
}

void velRbClear(resbuf* rb) {
  if (rb == nullptr) return;
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

std::vector<std::string> velSysVarNames() {
  std::vector<std::string> names;
  for (const auto& [name, var] : Table()) names.push_back(name);
  return names;
}

std::string velSysVarText(const std::string& name) {
  SysVar* var = Find(name);
  Value value;
  if (var == nullptr || !var->get(value)) return {};
  switch (var->kind) {
    case Kind::Short: return FormatInt(value.integer);
    case Kind::Real: return FormatRealShortest(value.real);
    case Kind::String: return value.text;
  }
  return {};
}

int velSetSysVarText(const std::string& name, const std::string& text, std::string& error) {
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
  if (status != RTNORM && error.empty()) error = FormatString("Valeur refusée pour %s.", name.c_str());
  return status;
}
