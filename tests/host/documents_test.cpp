// The document manager: events seen by reactors, the current document, the working
// database and the resource stack.
#include "velhost/documents.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "support/session.hpp"

namespace {

class Recorder : public AcApDocManagerReactor {
public:
    void documentCreateStarted(AcApDocument* d) override { Log("createStarted", d); }
    void documentCreated(AcApDocument* d) override { Log("created", d); }
    void documentToBeDestroyed(AcApDocument* d) override { Log("toBeDestroyed", d); }
    void documentDestroyed(const char* name) override { events.push_back(std::string("destroyed ") + name); }
    void documentBecameCurrent(AcApDocument* d) override { Log("becameCurrent", d); }
    void documentToBeActivated(AcApDocument* d) override { Log("toBeActivated", d); }
    void documentToBeDeactivated(AcApDocument* d) override { Log("toBeDeactivated", d); }
    void documentActivated(AcApDocument* d) override { Log("activated", d); }
    void documentLockModeChanged(AcApDocument* d, AcAp::DocLockMode, AcAp::DocLockMode newMode,
                                 const char* cmd) override
    {
        Log(std::string("lock ") + std::to_string(newMode) + " " + cmd, d);
    }

    void Log(const std::string& what, AcApDocument* d)
    {
        events.push_back(what + " " + (d ? d->docTitle() : std::string("-")));
    }
    std::vector<std::string> events;
};

class DocManager : public ::testing::Test {
protected:
    void SetUp() override { acDocManagerPtr()->addReactor(&recorder); }
    void TearDown() override
    {
        acDocManagerPtr()->removeReactor(&recorder);
        acDocManagerPtr()->closeAll();
    }
    ScriptedSession session;
    Recorder recorder;
};

TEST_F(DocManager, CreateSwitchAndCloseAreAnnounced)
{
    AcApDocManager* dm = acDocManagerPtr();
    AcApDocument* first = dm->createDocument(nullptr, "");
    const std::string a = first->docTitle();
    AcApDocument* second = dm->createDocument(std::make_unique<AcDbDatabase>(), "/tmp/plan.dxf");
    EXPECT_EQ(second->docTitle(), "plan.dxf");
    EXPECT_EQ(dm->curDocument(), second);
    EXPECT_EQ(acdbHostApplicationServices()->workingDatabase(), second->database());
    EXPECT_EQ(dm->documentCount(), 2);

    recorder.events.clear();
    ASSERT_TRUE(dm->activateDocument(first));
    EXPECT_EQ(recorder.events, (std::vector<std::string>{"toBeDeactivated plan.dxf", "toBeActivated " + a,
                                                         "becameCurrent " + a, "activated " + a}));

    recorder.events.clear();
    ASSERT_TRUE(dm->closeDocument(first));
    // The closing document is gone from the open documents before another becomes current.
    EXPECT_EQ(recorder.events,
              (std::vector<std::string>{"toBeDestroyed " + a, "destroyed " + a, "toBeActivated plan.dxf",
                                        "becameCurrent plan.dxf", "activated plan.dxf"}));
    EXPECT_EQ(dm->curDocument(), second);
    EXPECT_FALSE(dm->closeDocument(first));
    ASSERT_TRUE(dm->closeDocument(second));
    EXPECT_EQ(dm->curDocument(), nullptr);
    EXPECT_EQ(acdbHostApplicationServices()->workingDatabase(), nullptr);
}

TEST_F(DocManager, CommandsLockTheCurrentDocument)
{
    AcApDocument* doc = acDocManagerPtr()->createDocument(nullptr, "/tmp/l.dxf");
    recorder.events.clear();
    acDocManagerPtr()->lockForCommand("ZodEVICreate");
    acDocManagerPtr()->unlockAfterCommand("ZodEVICreate");
    EXPECT_EQ(recorder.events, (std::vector<std::string>{"lock 1 ZodEVICreate " + doc->docTitle(),
                                                         "lock 2 ZodEVICreate " + doc->docTitle()}));
}

} // namespace
