// The schedule's editor: in a terminal, the table opened in the user's text editor; in a
// script, edit lines read from the script. Both end in one validated session whose
// changes are written to the file and handed back to the caller.
#pragma once

#include "schedule_edit.hpp"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace metre {

// The text editor command: $VISUAL, else $EDITOR, else the first of sensible-editor,
// editor, nano and vi found on the PATH.
std::string TextEditorCommand();

// Opens `file` in the editor at `line` and waits for it; false with a French message when
// it cannot be started or ends in failure.
bool RunTextEditor(const std::string& file, int line, std::string& error);

// Runs a session over the schedule file, then writes it. 0 with the changes appended to
// records (owned by the caller afterwards) and actions; non-zero when the file cannot be
// read or written, the user cancels or nothing changed.
int EditScheduleFile(const std::string& path, const std::string& treePath, std::vector<CZodEVIArticle*>* records,
                     std::vector<std::uint32_t>* actions);

// The scripted session: "supprimer <chemin>", "ajouter <chemin>", "champ <nom> <chemin>"
// followed by a line holding the value, then "fin" to validate or "annuler". False when
// cancelled, at the end of the input, or on an edit that cannot be applied (message
// printed with the script line).
bool RunScriptedSession(ScheduleEdit& edit, const std::string& treePath);

// The terminal session; false when the user gave up.
bool RunTerminalSession(ScheduleEdit& edit, const std::string& path, const std::string& treePath);

} // namespace metre
