// What a reader (or a writer) of a file answers: done, or why not and where, with the French
// message the user sees. Standard library only, so that any module can answer it too.
#pragma once

#include <cstdint>
#include <cstring>
#include <string>
#include <utility>

enum class VelReadStatus : unsigned char {
    kOk,         // the whole file was read
    kNotFound,   // no such file
    kNotAFile,   // a folder or a device, not a regular file
    kCannotOpen, // the file exists but cannot be opened (see error)
    kCannotRead, // an input error while reading it (see error)
    kMalformed,  // the text is not what was expected at `line`
    kCannotWrite // for a writer answering the same type: the file could not be written
};

struct VelReadResult {
    VelReadStatus status = VelReadStatus::kOk;
    std::string file;      // the file as messages name it
    std::int64_t line = 0; // line of the fault (in a binary drawing, the group); 0 when none
    std::string expected;  // kMalformed: what was expected at `line`
    int error = 0;         // errno, when the system said why
    std::string message;   // the reader's own wording of the fault; empty: description()'s

    explicit operator bool() const { return status == VelReadStatus::kOk; }

    // A file the system would not open or read (or write) as a whole.
    static VelReadResult Failed(VelReadStatus status, std::string file, int error = 0, std::string message = {})
    {
        VelReadResult result;
        result.status = status;
        result.file = std::move(file);
        result.error = error;
        result.message = std::move(message);
        return result;
    }
    // A file whose text is not what was expected at a line.
    static VelReadResult Malformed(std::string file, std::int64_t line, std::string expected, std::string message = {})
    {
        VelReadResult result;
        result.status = VelReadStatus::kMalformed;
        result.file = std::move(file);
        result.line = line;
        result.expected = std::move(expected);
        result.message = std::move(message);
        return result;
    }

    // The French message: `message` when the reader gave one, otherwise
    // "« file », ligne N : il fallait …", "« file » : impossible d'ouvrir le fichier (…)",
    // "« file » : ce n'est pas un fichier ordinaire", "« file » : lecture impossible (…)" or
    // "« file » : écriture impossible (…)"; "" when read.
    std::string description() const
    {
        if (!message.empty())
            return message;
        const std::string subject = "« " + file + " »";
        const std::string reason = error != 0 ? std::string(" (") + std::strerror(error) + ")" : std::string();
        switch (status) {
        case VelReadStatus::kOk:
            return {};
        case VelReadStatus::kNotFound:
        case VelReadStatus::kCannotOpen:
            return subject + " : impossible d'ouvrir le fichier" + reason;
        case VelReadStatus::kNotAFile:
            return subject + " : ce n'est pas un fichier ordinaire";
        case VelReadStatus::kCannotRead:
            return subject + " : lecture impossible" + reason;
        case VelReadStatus::kMalformed:
            return subject + (line > 0 ? ", ligne " + std::to_string(line) : std::string()) + " : il fallait " +
                   expected;
        case VelReadStatus::kCannotWrite:
            return subject + " : écriture impossible" + reason;
        }
        return subject;
    }
};
