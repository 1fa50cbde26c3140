// The document manager: the drawings open in the host, each owning its database, the
// current one, the reactors told of every change, and the resource-handle stack.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "velhost/dbase.h"
#include "velhost/rx.h"

#pragma GCC visibility push(default)

// One open drawing.
class AcApDocument {
public:
    AcApDocument(std::unique_ptr<AcDbDatabase> database, std::string fileName);
    ~AcApDocument();
    AcDbDatabase* database() const { return database_.get(); }
    // Path of the drawing file, "" for a drawing never saved.
    const std::string& fileName() const { return fileName_; }
    void setFileName(std::string fileName) { fileName_ = std::move(fileName); }
    // Title shown to the user: the file's name, or "DessinN" for a new drawing.
    const std::string& docTitle() const { return title_; }
    void setDocTitle(std::string title) { title_ = std::move(title); }

private:
    std::unique_ptr<AcDbDatabase> database_;
    std::string fileName_;
    std::string title_;
};

namespace AcAp {
enum DocLockMode {
    kNone = 0,
    kAutoWrite = 1,
    kNotLocked = 2,
    kWrite = 4,
    kProtectedAutoWrite = 20,
    kRead = 32,
    kXWrite = 64
};
} // namespace AcAp

// Told of the document manager's events. Every operation does nothing by default.
class AcApDocManagerReactor : public AcRxObject {
public:
    const char* className() const override;
    virtual void documentCreateStarted(AcApDocument* doc);
    virtual void documentCreated(AcApDocument* doc);
    virtual void documentToBeDestroyed(AcApDocument* doc);
    virtual void documentDestroyed(const char* fileName);
    virtual void documentCreateCanceled(AcApDocument* doc);
    virtual void documentLockModeWillChange(AcApDocument* doc, AcAp::DocLockMode currentMode, AcAp::DocLockMode newMode,
                                            const char* commandName);
    virtual void documentLockModeChangeVetoed(AcApDocument* doc, const char* commandName);
    virtual void documentLockModeChanged(AcApDocument* doc, AcAp::DocLockMode oldMode, AcAp::DocLockMode newMode,
                                         const char* commandName);
    virtual void documentBecameCurrent(AcApDocument* doc);
    virtual void documentToBeActivated(AcApDocument* doc);
    virtual void documentToBeDeactivated(AcApDocument* doc);
    virtual void documentActivationModified(bool activation);
    virtual void documentActivated(AcApDocument* doc);
};

// Walks the open documents in opening order; delete it when done.
class AcApDocumentIterator {
public:
    explicit AcApDocumentIterator(std::vector<AcApDocument*> documents);
    bool done() const;
    void step();
    AcApDocument* document() const;

private:
    std::vector<AcApDocument*> documents_;
    std::size_t pos_ = 0;
};

class AcApDocManager : public AcRxObject {
public:
    AcApDocManager();
    ~AcApDocManager() override;
    const char* className() const override;

    // The current document, null when none is open.
    AcApDocument* curDocument() const;
    AcApDocument* mdiActiveDocument() const { return curDocument(); }
    int documentCount() const;
    AcApDocumentIterator* newAcApDocumentIterator() const;

    void addReactor(AcApDocManagerReactor* reactor);
    void removeReactor(AcApDocManagerReactor* reactor);
    // Host side: removes the reactors a module added (appId) and never removed, once its
    // code is gone; answers how many.
    std::size_t removeReactorsOf(void* appId);

    // Makes a module's resources current around its dialogs; pops answer false when the
    // stack is empty.
    bool pushResourceHandle(void* handle);
    bool popResourceHandle();
    // The resource handle on top, null when none was pushed.
    void* currentResourceHandle() const;

    // Host side. Opens a document on the database (a new empty drawing when null), makes
    // it current and tells reactors and modules. Answers the new document.
    AcApDocument* createDocument(std::unique_ptr<AcDbDatabase> database, const std::string& fileName);
    // Closes a document: reactors and modules are told first; another document, if any,
    // becomes current afterwards. False when the document is not open.
    bool closeDocument(AcApDocument* doc);
    // Makes an open document current; false when it is not open.
    bool activateDocument(AcApDocument* doc);
    // Lock mode around a command: reactors see the change and its end.
    void lockForCommand(const char* commandName);
    void unlockAfterCommand(const char* commandName);
    // Closes every document, the current one last.
    void closeAll();

private:
    void notifyBecameCurrent(AcApDocument* doc);
    std::vector<std::unique_ptr<AcApDocument>> documents_;
    AcApDocument* current_ = nullptr;
    std::vector<AcApDocManagerReactor*> reactors_;
    std::vector<void*> reactorOwners_; // the module that added each reactor
    std::vector<void*> resources_;
    int untitledCounter_ = 0;
    AcAp::DocLockMode lockMode_ = AcAp::kNotLocked;
};

AcApDocManager* acDocManagerPtr();
#define acDocManager acDocManagerPtr()

// Application services: the working database is the current document's.
class AcDbHostApplicationServices {
public:
    AcDbDatabase* workingDatabase() const;
};
AcDbHostApplicationServices* acdbHostApplicationServices();

#pragma GCC visibility pop
