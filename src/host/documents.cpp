// Document manager: open drawings with their databases, the current one, reactors told
// of every change, modules told of drawings opened and closed, the resource stack.
#include "velhost/documents.h"

#include <algorithm>
#include <filesystem>

#include "host_internal.h"
#include "text/text.hpp"

AcApDocument::AcApDocument(std::unique_ptr<AcDbDatabase> database, std::string fileName)
    : database_(std::move(database)), fileName_(std::move(fileName))
{
    if (!database_)
        database_ = std::make_unique<AcDbDatabase>();
}

AcApDocument::~AcApDocument() = default;

const char* AcApDocManagerReactor::className() const
{
    return "AcApDocManagerReactor";
}
void AcApDocManagerReactor::documentCreateStarted(AcApDocument*) {}
void AcApDocManagerReactor::documentCreated(AcApDocument*) {}
void AcApDocManagerReactor::documentToBeDestroyed(AcApDocument*) {}
void AcApDocManagerReactor::documentDestroyed(const char*) {}
void AcApDocManagerReactor::documentCreateCanceled(AcApDocument*) {}
void AcApDocManagerReactor::documentLockModeWillChange(AcApDocument*, AcAp::DocLockMode, AcAp::DocLockMode, const char*)
{}
void AcApDocManagerReactor::documentLockModeChangeVetoed(AcApDocument*, const char*) {}
void AcApDocManagerReactor::documentLockModeChanged(AcApDocument*, AcAp::DocLockMode, AcAp::DocLockMode, const char*) {}
void AcApDocManagerReactor::documentBecameCurrent(AcApDocument*) {}
void AcApDocManagerReactor::documentToBeActivated(AcApDocument*) {}
void AcApDocManagerReactor::documentToBeDeactivated(AcApDocument*) {}
void AcApDocManagerReactor::documentActivationModified(bool) {}
void AcApDocManagerReactor::documentActivated(AcApDocument*) {}

AcApDocumentIterator::AcApDocumentIterator(std::vector<AcApDocument*> documents) : documents_(std::move(documents)) {}
bool AcApDocumentIterator::done() const
{
    return pos_ >= documents_.size();
}
void AcApDocumentIterator::step()
{
    if (pos_ < documents_.size())
        ++pos_;
}
AcApDocument* AcApDocumentIterator::document() const
{
    return done() ? nullptr : documents_[pos_];
}

AcApDocManager::AcApDocManager() = default;
AcApDocManager::~AcApDocManager() = default;
const char* AcApDocManager::className() const
{
    return "AcApDocManager";
}

AcApDocument* AcApDocManager::curDocument() const
{
    return current_;
}
int AcApDocManager::documentCount() const
{
    return static_cast<int>(documents_.size());
}

AcApDocumentIterator* AcApDocManager::newAcApDocumentIterator() const
{
    std::vector<AcApDocument*> docs;
    for (const auto& d : documents_)
        docs.push_back(d.get());
    return new AcApDocumentIterator(std::move(docs));
}

void AcApDocManager::addReactor(AcApDocManagerReactor* reactor)
{
    if (reactor != nullptr && std::find(reactors_.begin(), reactors_.end(), reactor) == reactors_.end()) {
        reactors_.push_back(reactor);
        reactorOwners_.push_back(velCurrentApp());
    }
}

void AcApDocManager::removeReactor(AcApDocManagerReactor* reactor)
{
    auto it = std::find(reactors_.begin(), reactors_.end(), reactor);
    if (it == reactors_.end())
        return;
    reactorOwners_.erase(reactorOwners_.begin() + (it - reactors_.begin()));
    reactors_.erase(it);
}

std::size_t AcApDocManager::removeReactorsOf(void* appId)
{
    std::size_t removed = 0;
    for (std::size_t i = reactors_.size(); i-- > 0;) {
        if (appId == nullptr || reactorOwners_[i] != appId)
            continue;
        reactors_.erase(reactors_.begin() + static_cast<std::ptrdiff_t>(i));
        reactorOwners_.erase(reactorOwners_.begin() + static_cast<std::ptrdiff_t>(i));
        ++removed;
    }
    return removed;
}

namespace {

// Reactors may add or remove reactors while told: tell a snapshot, skipping those gone.
template <class Fn>
void Tell(const std::vector<AcApDocManagerReactor*>& reactors, Fn fn)
{
    const std::vector<AcApDocManagerReactor*> snapshot = reactors;
    for (AcApDocManagerReactor* r : snapshot)
        if (std::find(reactors.begin(), reactors.end(), r) != reactors.end())
            fn(r);
}

} // namespace

bool AcApDocManager::pushResourceHandle(void* handle)
{
    resources_.push_back(handle);
    return true;
}

bool AcApDocManager::popResourceHandle()
{
    if (resources_.empty())
        return false;
    resources_.pop_back();
    return true;
}

void* AcApDocManager::currentResourceHandle() const
{
    return resources_.empty() ? nullptr : resources_.back();
}

void AcApDocManager::notifyBecameCurrent(AcApDocument* doc)
{
    AcApDocument* previous = current_;
    if (previous != nullptr && previous != doc)
        Tell(reactors_, [&](auto* r) { r->documentToBeDeactivated(previous); });
    if (doc != nullptr)
        Tell(reactors_, [&](auto* r) { r->documentToBeActivated(doc); });
    current_ = doc;
    if (doc == nullptr)
        return;
    Tell(reactors_, [&](auto* r) { r->documentBecameCurrent(doc); });
    Tell(reactors_, [&](auto* r) { r->documentActivated(doc); });
}

AcApDocument* AcApDocManager::createDocument(std::unique_ptr<AcDbDatabase> database, const std::string& fileName)
{
    auto doc = std::make_unique<AcApDocument>(std::move(database), fileName);
    if (fileName.empty())
        doc->setDocTitle(FormatString("Dessin%d", ++untitledCounter_));
    else
        doc->setDocTitle(std::filesystem::path(fileName).filename().string());
    AcApDocument* raw = doc.get();
    Tell(reactors_, [&](auto* r) { r->documentCreateStarted(raw); });
    documents_.push_back(std::move(doc));
    // The new drawing is the working one while reactors and modules are told of it.
    AcApDocument* previous = current_;
    if (previous != nullptr)
        Tell(reactors_, [&](auto* r) { r->documentToBeDeactivated(previous); });
    current_ = raw;
    Tell(reactors_, [&](auto* r) { r->documentCreated(raw); });
    velBroadcastAppMessage(AcRx::kLoadDwgMsg);
    Tell(reactors_, [&](auto* r) { r->documentToBeActivated(raw); });
    Tell(reactors_, [&](auto* r) { r->documentBecameCurrent(raw); });
    Tell(reactors_, [&](auto* r) { r->documentActivated(raw); });
    return raw;
}

bool AcApDocManager::closeDocument(AcApDocument* doc)
{
    auto it = std::find_if(documents_.begin(), documents_.end(), [&](const auto& d) { return d.get() == doc; });
    if (it == documents_.end())
        return false;
    Tell(reactors_, [&](auto* r) { r->documentToBeDestroyed(doc); });
    // Modules see the closing drawing as the working one.
    AcApDocument* previous = current_;
    current_ = doc;
    velBroadcastAppMessage(AcRx::kUnloadDwgMsg);
    current_ = previous;
    it = std::find_if(documents_.begin(), documents_.end(), [&](const auto& d) { return d.get() == doc; });
    std::unique_ptr<AcApDocument> owned = std::move(*it);
    documents_.erase(it);
    const std::string name = owned->fileName().empty() ? owned->docTitle() : owned->fileName();
    const bool wasCurrent = current_ == doc;
    if (wasCurrent)
        current_ = nullptr;
    owned.reset();
    Tell(reactors_, [&](auto* r) { r->documentDestroyed(name.c_str()); });
    if (wasCurrent && !documents_.empty())
        notifyBecameCurrent(documents_.back().get());
    return true;
}

bool AcApDocManager::activateDocument(AcApDocument* doc)
{
    auto it = std::find_if(documents_.begin(), documents_.end(), [&](const auto& d) { return d.get() == doc; });
    if (it == documents_.end())
        return false;
    if (doc != current_)
        notifyBecameCurrent(doc);
    return true;
}

void AcApDocManager::lockForCommand(const char* commandName)
{
    if (current_ == nullptr)
        return;
    const AcAp::DocLockMode old = lockMode_;
    Tell(reactors_, [&](auto* r) { r->documentLockModeWillChange(current_, old, AcAp::kAutoWrite, commandName); });
    lockMode_ = AcAp::kAutoWrite;
    Tell(reactors_, [&](auto* r) { r->documentLockModeChanged(current_, old, AcAp::kAutoWrite, commandName); });
}

void AcApDocManager::unlockAfterCommand(const char* commandName)
{
    if (current_ == nullptr || lockMode_ == AcAp::kNotLocked)
        return;
    const AcAp::DocLockMode old = lockMode_;
    Tell(reactors_, [&](auto* r) { r->documentLockModeWillChange(current_, old, AcAp::kNotLocked, commandName); });
    lockMode_ = AcAp::kNotLocked;
    Tell(reactors_, [&](auto* r) { r->documentLockModeChanged(current_, old, AcAp::kNotLocked, commandName); });
}

void AcApDocManager::closeAll()
{
    while (!documents_.empty()) {
        AcApDocument* victim = documents_.front().get() == current_ && documents_.size() > 1 ? documents_[1].get()
                                                                                             : documents_.front().get();
        closeDocument(victim);
    }
}

AcApDocManager* acDocManagerPtr()
{
    static AcApDocManager* manager = new AcApDocManager;
    return manager;
}

AcDbDatabase* AcDbHostApplicationServices::workingDatabase() const
{
    AcApDocument* doc = acDocManagerPtr()->curDocument();
    return doc ? doc->database() : nullptr;
}

AcDbHostApplicationServices* acdbHostApplicationServices()
{
    static AcDbHostApplicationServices services;
    return &services;
}
