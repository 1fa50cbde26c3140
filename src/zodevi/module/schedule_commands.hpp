// The two commands that give the user the price schedule: its editor, and the purge of
// obsolete articles at the next updates.
#pragma once

namespace zodevi {

// "ZodEVIBdrPrix": opens the editor on the schedule file and mirrors the changes.
void DisplayScheduleCommand();
// "ZodEVIBdrPurge": asks whether the next updates remove obsolete articles.
void PurgeScheduleCommand();

} // namespace zodevi
