// Per-document records of the drawing settings a command may disturb (`CArxGlobals`),
// and the document-manager reactor that keeps one record per open drawing.
#pragma once

#include <algorithm>
#include <cstddef>
#include <memory>
#include <vector>

#include "velhost/dbase.h"
#include "velhost/documents.h"

namespace zodevi {

class CArxGlobals {
public:
    explicit CArxGlobals(bool saveAtCreation = false, bool restoreLayer = true, bool echo = false);
    // Puts the settings back when they are still saved.
    ~CArxGlobals();
    CArxGlobals(const CArxGlobals&) = delete;
    CArxGlobals& operator=(const CArxGlobals&) = delete;

    // Reads the settings from the working drawing; false without one.
    bool SaveSettings();
    // Saves (unless already saved), then sets CMDECHO, UCSFOLLOW 0 and LIMCHECK off.
    void PrepareForCommand(bool echo);
    // Writes the saved settings back, the current layer too when asked.
    void RestoreSettings(bool restoreLayer);
    // The drawing is closing: its settings can no longer be put back.
    void ForgetDrawing();

    bool saveAtCreation = false;
    bool saved = false;
    bool restoreLayer = true;
    short aunits = 0;
    double angbase = 0;
    bool angdir = false;
    short osmode = 0;
    AcCmColor cecolor;
    bool attdia = false;
    bool attreq = false;
    bool limcheck = false;
    bool orthomode = false;
    AcDbObjectId clayer;
    bool ucsfollow = false;
    int aflags = 0;

private:
    // The drawing the settings were saved from; they go back to no other.
    AcDbDatabase* source = nullptr;
};

// One record per document, created as documents appear, destroyed once they are gone.
// Hash order is not involved: records are kept in the order their documents appeared.
template <class T>
class CVelDataMDIManager : public AcApDocManagerReactor {
public:
    CVelDataMDIManager()
    {
        acDocManagerPtr()->addReactor(this);
        current = DataFor(nullptr);
    }

    ~CVelDataMDIManager() override
    {
        acDocManagerPtr()->removeReactor(this);
        for (std::size_t i = 0; i < documents.size(); ++i) {
            pendingDocuments.push_back(documents[i]);
            pendingRecords.push_back(std::move(records[i]));
        }
        documents.clear();
        records.clear();
        PurgeClosed();
        current = nullptr;
    }

    CVelDataMDIManager(const CVelDataMDIManager&) = delete;
    CVelDataMDIManager& operator=(const CVelDataMDIManager&) = delete;

    // The record of a document (the current one when null), created when missing.
    T* DataFor(AcApDocument* document)
    {
        if (document == nullptr)
            document = acDocManagerPtr()->curDocument();
        for (std::size_t i = 0; i < documents.size(); ++i)
            if (documents[i] == document)
                return records[i].get();
        documents.push_back(document);
        records.push_back(std::make_unique<T>(false, true, false));
        return records.back().get();
    }

    // Destroys the records of the pending documents that are no longer open.
    void PurgeClosed()
    {
        for (std::size_t i = 0; i < pendingDocuments.size();) {
            if (IsOpen(pendingDocuments[i])) {
                ++i;
                continue;
            }
            if (current == pendingRecords[i].get())
                current = nullptr;
            pendingRecords[i].reset();
            pendingDocuments.erase(pendingDocuments.begin() + static_cast<std::ptrdiff_t>(i));
            pendingRecords.erase(pendingRecords.begin() + static_cast<std::ptrdiff_t>(i));
        }
    }

    void documentCreated(AcApDocument* document) override
    {
        current = DataFor(document);
        PurgeClosed();
    }

    void documentBecameCurrent(AcApDocument* document) override { documentCreated(document); }

    void documentToBeDestroyed(AcApDocument* document) override
    {
        for (std::size_t i = 0; i < documents.size(); ++i) {
            if (documents[i] != document)
                continue;
            records[i]->ForgetDrawing();
            pendingDocuments.push_back(documents[i]);
            pendingRecords.push_back(std::move(records[i]));
            documents.erase(documents.begin() + static_cast<std::ptrdiff_t>(i));
            records.erase(records.begin() + static_cast<std::ptrdiff_t>(i));
            return;
        }
    }

    // The record of the current document, or none.
    T* current = nullptr;

    std::size_t RecordCount() const { return documents.size(); }
    std::size_t PendingCount() const { return pendingDocuments.size(); }

private:
    static bool IsOpen(AcApDocument* document)
    {
        std::unique_ptr<AcApDocumentIterator> it(acDocManagerPtr()->newAcApDocumentIterator());
        for (; !it->done(); it->step())
            if (it->document() == document)
                return true;
        return false;
    }

    std::vector<AcApDocument*> documents;
    std::vector<std::unique_ptr<T>> records;
    std::vector<AcApDocument*> pendingDocuments;
    std::vector<std::unique_ptr<T>> pendingRecords;
};

} // namespace zodevi
