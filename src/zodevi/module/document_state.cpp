// Saving and restoring the drawing settings of one document around a command.
#include "module/document_state.hpp"

#include "velhost/editor.h"

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
    aunits = db->aunits();
    angbase = db->angbase();
    angdir = db->angdir();
    osmode = static_cast<short>(db->osmode());
    cecolor = db->cecolor();
    attdia = db->attdia();
    attreq = db->attreq();
    limcheck = db->limcheck();
    orthomode = db->orthomode();
    clayer = db->clayer();
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
        db->setAunits(aunits);
        db->setAngbase(angbase);
        db->setAngdir(angdir);
        db->setOsmode(osmode);
        db->setCecolor(cecolor);
        db->setAttdia(attdia);
        db->setAttreq(attreq);
        db->setLimcheck(limcheck);
        db->setOrthomode(orthomode);
        if (restoreLayer_)
            db->setClayer(clayer);
        SetShortVar("AFLAGS", aflags);
        SetShortVar("UCSFOLLOW", ucsfollow ? 1 : 0);
    }
    saved = false;
}

void CArxGlobals::ForgetDrawing()
{
    source = nullptr;
}
