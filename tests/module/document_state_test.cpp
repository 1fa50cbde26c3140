// Per-document records: settings saved and restored around commands, one record per
// document, records purged once their document is gone.
#include "module/document_state.hpp"

#include <gtest/gtest.h>

#include "support/session.hpp"
#include "velhost/editor.h"

using namespace zodevi;

namespace {

int Var(const char* name)
{
    resbuf rb;
    if (acedGetVar(name, &rb) != RTNORM)
        return -1;
    return rb.resval.rint;
}

void SetVar(const char* name, int value)
{
    std::string error;
    ASSERT_EQ(velSetSysVarText(name, std::to_string(value), error), RTNORM) << error;
}

class DocumentState : public ::testing::Test {
protected:
    void SetUp() override
    {
        SetVar("CMDECHO", 1);
        SetVar("UCSFOLLOW", 1);
        SetVar("AFLAGS", 3);
    }
    void TearDown() override
    {
        acDocManagerPtr()->closeAll();
        SetVar("CMDECHO", 1);
        SetVar("UCSFOLLOW", 0);
        SetVar("AFLAGS", 0);
    }
    ScriptedSession session;
};

TEST_F(DocumentState, CommandRestoresWhatItDisturbed)
{
    AcApDocument* doc = acDocManagerPtr()->createDocument(nullptr, "");
    AcDbDatabase* db = doc->database();
    AcDbObjectId layer;
    ASSERT_EQ(db->addLayer("Réseaux", layer), Acad::eOk);
    db->setLimcheck(true);
    db->setOsmode(32767); // the top of its range survives the record
    CArxGlobals record;
    record.PrepareForCommand(false);
    EXPECT_TRUE(record.saved);
    EXPECT_EQ(Var("CMDECHO"), 0);
    EXPECT_EQ(Var("UCSFOLLOW"), 0);
    EXPECT_FALSE(db->limcheck());

    // What a command may change.
    db->setAunits(3);
    db->setAngbase(1.25);
    db->setAngdir(true);
    db->setOsmode(0);
    db->setClayer(layer);
    db->setOrthomode(true);
    AcCmColor red;
    red.setColorIndex(1);
    db->setCecolor(red);
    SetVar("AFLAGS", 0);
    // A second preparation keeps the first saved values.
    record.PrepareForCommand(false);
    record.RestoreSettings(true);

    EXPECT_FALSE(record.saved);
    EXPECT_EQ(db->aunits(), 0);
    EXPECT_EQ(db->angbase(), 0.0);
    EXPECT_FALSE(db->angdir());
    EXPECT_EQ(db->osmode(), 32767);
    EXPECT_TRUE(db->limcheck());
    EXPECT_FALSE(db->orthomode());
    EXPECT_TRUE(db->cecolor().isByLayer());
    EXPECT_EQ(db->layerName(db->clayer()), "0");
    EXPECT_EQ(Var("AFLAGS"), 3);
    EXPECT_EQ(Var("UCSFOLLOW"), 1);
    // CMDECHO is never put back.
    EXPECT_EQ(Var("CMDECHO"), 0);
}

TEST_F(DocumentState, LayerKeptWhenNotAskedFor)
{
    AcApDocument* doc = acDocManagerPtr()->createDocument(nullptr, "");
    AcDbObjectId layer;
    doc->database()->addLayer("Voirie", layer);
    CArxGlobals record;
    record.PrepareForCommand(true);
    EXPECT_EQ(Var("CMDECHO"), 1);
    doc->database()->setClayer(layer);
    record.RestoreSettings(false);
    EXPECT_EQ(doc->database()->clayer(), layer);
}

TEST_F(DocumentState, NothingHappensWithoutADrawing)
{
    CArxGlobals record(true, true, false);
    EXPECT_FALSE(record.saved);
    record.PrepareForCommand(false);
    EXPECT_FALSE(record.saved);
    EXPECT_EQ(Var("CMDECHO"), 1);
    record.RestoreSettings(true);
}

TEST_F(DocumentState, RecordSavedAtCreationRestoresWhenDestroyed)
{
    AcApDocument* doc = acDocManagerPtr()->createDocument(nullptr, "");
    {
        CArxGlobals record(true, true, false);
        EXPECT_TRUE(record.saved);
        EXPECT_EQ(Var("CMDECHO"), 0);
        doc->database()->setAunits(2);
    }
    EXPECT_EQ(doc->database()->aunits(), 0);
}

TEST_F(DocumentState, SettingsNeverGoToAnotherDrawing)
{
    AcApDocument* a = acDocManagerPtr()->createDocument(nullptr, "");
    a->database()->setAunits(1);
    CArxGlobals record;
    record.PrepareForCommand(false);
    AcApDocument* b = acDocManagerPtr()->createDocument(nullptr, "");
    b->database()->setAunits(4);
    record.RestoreSettings(true);
    EXPECT_EQ(b->database()->aunits(), 4);
    EXPECT_FALSE(record.saved);
}

TEST_F(DocumentState, OneRecordPerDocumentAndPurgeAfterClose)
{
    AcApDocument* a = acDocManagerPtr()->createDocument(nullptr, "");
    CVelDataMDIManager<CArxGlobals> manager;
    CArxGlobals* recordA = manager.current;
    ASSERT_NE(recordA, nullptr);
    EXPECT_EQ(manager.DataFor(a), recordA);
    EXPECT_EQ(manager.DataFor(nullptr), recordA);

    AcApDocument* b = acDocManagerPtr()->createDocument(nullptr, "");
    CArxGlobals* recordB = manager.current;
    EXPECT_NE(recordB, recordA);
    EXPECT_EQ(manager.DataFor(b), recordB);
    acDocManagerPtr()->activateDocument(a);
    EXPECT_EQ(manager.current, recordA);
    EXPECT_EQ(manager.RecordCount(), 2u);

    // A closing announced while the document stays open keeps the record pending.
    manager.documentToBeDestroyed(b);
    EXPECT_EQ(manager.PendingCount(), 1u);
    manager.PurgeClosed();
    EXPECT_EQ(manager.PendingCount(), 1u);
    EXPECT_EQ(manager.RecordCount(), 1u);

    // Really closed, it waits for the next purge: a new or another current document.
    acDocManagerPtr()->closeDocument(b);
    EXPECT_EQ(manager.PendingCount(), 1u);
    AcApDocument* c = acDocManagerPtr()->createDocument(nullptr, "");
    EXPECT_EQ(manager.PendingCount(), 0u);
    CArxGlobals* recordC = manager.current;
    EXPECT_EQ(manager.DataFor(c), recordC);

    // A record still saved when its document closes is dropped, not written into the
    // drawing that is current then.
    acDocManagerPtr()->activateDocument(a);
    recordA->PrepareForCommand(false);
    a->database()->setAunits(2);
    c->database()->setAunits(1);
    acDocManagerPtr()->closeDocument(a);
    EXPECT_EQ(manager.current, recordC);
    EXPECT_EQ(manager.PendingCount(), 0u);
    EXPECT_EQ(manager.RecordCount(), 1u);
    EXPECT_EQ(c->database()->aunits(), 1);
}

} // namespace
