// Saving and restoring the drawing settings of one document around a command.
#include "module/document_state.hpp"

#include <type_traits>

#include "velhost/editor.h"
#include "velhost/header_vars.h"

namespace zodevi {

namespace {

AcDbDatabase* WorkingDatabase()
{
    return acdbHostApplicationServices()->workingDatabase();
}

// A system variable as a 16-bit value; 0 when the host gives none.
int GetShortVar(const char* name)
{
    resbuf rb;
    if (acedGetVar(name, &rb) != RTNORM)
        return 0;
    const int value = rb.restype == RTSHORT ? rb.resval.rint : 0;
    velRbClear(&rb);
    return value;
}

// A refused write is ignored.
void SetShortVar(const char* name, int value)
{
    resbuf rb;
    rb.restype = RTSHORT;
    rb.resval.rint = static_cast<short>(value);
    acedSetVar(name, &rb);
}

} // namespace

CArxGlobals::CArxGlobals(bool saveAtCreation_, bool restoreLayer_, bool echo)
    : saveAtCreation(saveAtCreation_), restoreLayer(restoreLayer_)
{
    if (saveAtCreation) {
        saved = SaveSettings();
        if (saved)
            PrepareForCommand(echo);
    }
}

CArxGlobals::~CArxGlobals()
{
    if (saved)
        RestoreSettings(restoreLayer);
}

bool CArxGlobals::SaveSettings()
{
    AcDbDatabase* db = WorkingDatabase();
    if (db == nullptr)
        return false;
    // Each setting into the field of the same name: the record holds a layer by its id and
    // the colour as a colour.
    velWalkHeaderVars(
        [db](const VelHeaderVar&, auto& mine, const auto& drawing) {
            using Mine = std::remove_cvref_t<decltype(mine)>;
            if constexpr (std::is_same_v<Mine, AcDbObjectId>)
                db->getLayerId(drawing, mine);
            else if constexpr (std::is_same_v<Mine, AcCmColor>)
                mine = db->cecolor();
            else
                mine = static_cast<Mine>(drawing);
        },
        *this, db->headerSettings());
    aflags = GetShortVar("AFLAGS");
    ucsfollow = GetShortVar("UCSFOLLOW") == 1;
    restoreLayer = true;
    source = db;
    return true;
}

void CArxGlobals::PrepareForCommand(bool echo)
{
    if (!saved)
        saved = SaveSettings();
    if (!saved)
        return;
    SetShortVar("CMDECHO", echo ? 1 : 0);
    SetShortVar("UCSFOLLOW", 0);
    if (AcDbDatabase* db = WorkingDatabase())
        db->setLimcheck(false);
}

void CArxGlobals::RestoreSettings(bool restoreLayer_)
{
    AcDbDatabase* db = WorkingDatabase();
    if (db == nullptr)
        return;
    // Settings saved from another drawing would corrupt this one: they are dropped.
    if (db == source) {
        VelHeaderSettings settings = db->headerSettings();
        velWalkHeaderVars(
            [&](const VelHeaderVar&, auto& drawing, const auto& mine) {
                using Mine = std::remove_cvref_t<decltype(mine)>;
                if constexpr (std::is_same_v<Mine, AcDbObjectId>) {
                    const std::string layer = db->layerName(mine);
                    if (restoreLayer_ && !layer.empty())
                        drawing = layer;
                } else if constexpr (std::is_same_v<Mine, AcCmColor>) {
                    // A colour the record cannot hold (by entity) stays when it was not changed.
                    if (!(db->cecolor() == mine))
                        drawing = mine.colorIndex();
                } else {
                    drawing = mine;
                }
            },
            settings, *this);
        db->setHeaderSettings(settings);
        SetShortVar("AFLAGS", aflags);
        SetShortVar("UCSFOLLOW", ucsfollow ? 1 : 0);
    }
    saved = false;
}

void CArxGlobals::ForgetDrawing()
{
    source = nullptr;
}

} // namespace zodevi
