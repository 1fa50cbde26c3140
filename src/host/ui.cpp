// The two user-interface back-ends: a terminal (line editing and history when the
// input is one) and a command script whose lines answer every prompt.
#include "velhost/ui.h"

#include <editline/readline.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <iostream>

#include "text/text.hpp"

std::vector<int> velMessageBoxButtons(unsigned style) {
  switch (style & 0xF) {
    case MB_OKCANCEL: return {IDOK, IDCANCEL};
    case MB_ABORTRETRYIGNORE: return {IDABORT, IDRETRY, IDIGNORE};
    case MB_YESNOCANCEL: return {IDYES, IDNO, IDCANCEL};
    case MB_YESNO: return {IDYES, IDNO};
    case MB_RETRYCANCEL: return {IDRETRY, IDCANCEL};
    default: return {IDOK};
  }
}

int velMessageBoxDefault(unsigned style) {
  const std::vector<int> buttons = velMessageBoxButtons(style);
  const std::size_t index = (style >> 8) & 0xF;
  return index < buttons.size() ? buttons[index] : buttons.front();
}

const char* velMessageBoxLabel(int answer) {
  switch (answer) {
    case IDOK: return "OK";
    case IDCANCEL: return "Annuler";
    case IDABORT: return "Abandonner";
    case IDRETRY: return "Réessayer";
    case IDIGNORE: return "Ignorer";
    case IDYES: return "Oui";
    case IDNO: return "Non";
    default: return "?";
  }
}

std::string velMessageBoxTranscript(const VelMessageBox& box) {
  const char* kind = "";
  switch (box.style & 0xF0) {
    case MB_ICONERROR: kind = " (erreur)"; break;
    case MB_ICONQUESTION: kind = " (question)"; break;
    case MB_ICONWARNING: kind = " (avertissement)"; break;
    case MB_ICONINFORMATION: kind = " (information)"; break;
    default: break;
  }
  return FormatString("\n[%s%s]\n%s\n", box.caption.c_str(), kind, box.text.c_str());
}

// ---- base ----

VelUserInterface::~VelUserInterface() = default;

std::optional<VelInputLine> VelUserInterface::readLine(const std::string& prompt) {
  if (!pending_.empty()) {
    VelInputLine line{pending_.front(), 0};
    pending_.pop_front();
    print(prompt + line.text + "\n");
    return line;
  }
  return readRawLine(prompt);
}

void VelUserInterface::pushPendingInput(const std::vector<std::string>& words) {
  pending_.insert(pending_.end(), words.begin(), words.end());
}

std::size_t VelUserInterface::dropPendingInput() {
  const std::size_t n = pending_.size();
  pending_.clear();
  return n;
}

// ---- terminal ----

VelTerminalUI::VelTerminalUI(std::istream& in, std::ostream& out, bool lineEditing)
    : in_(in), out_(out), lineEditing_(lineEditing) {}

VelTerminalUI::~VelTerminalUI() = default;

void VelTerminalUI::print(const std::string& text) {
  out_ << text;
  out_.flush();
}

std::optional<VelInputLine> VelTerminalUI::readRawLine(const std::string& prompt) {
  if (lineEditing_) {
    // Line editing keeps the prompt on the same line as what is typed.
    const auto lastBreak = prompt.rfind('\n');
    if (lastBreak != std::string::npos) print(prompt.substr(0, lastBreak + 1));
    const std::string shown = lastBreak == std::string::npos ? prompt : prompt.substr(lastBreak + 1);
    char* raw = ::readline(shown.c_str());
    if (raw == nullptr) {
      ended_ = true;
      return std::nullopt;
    }
    std::string text(raw);
    std::free(raw);
    if (!text.empty()) add_history(text.c_str());
    return VelInputLine{text, 0};
  }
  print(prompt);
  std::string text;
  if (!std::getline(in_, text)) {
    ended_ = true;
    return std::nullopt;
  }
  if (!text.empty() && text.back() == '\r') text.pop_back();
  return VelInputLine{text, 0};
}

void VelTerminalUI::loadHistory(const std::string& fileName) {
  if (lineEditing_) read_history(fileName.c_str());
}

bool VelTerminalUI::saveHistory(const std::string& fileName) const {
  return !lineEditing_ || write_history(fileName.c_str()) == 0;
}

int VelTerminalUI::messageBox(const VelMessageBox& box) {
  print(velMessageBoxTranscript(box));
  const std::vector<int> buttons = velMessageBoxButtons(box.style);
  const int def = velMessageBoxDefault(box.style);
  if (buttons.size() == 1) {
    readLine(FormatString("[%s] ", velMessageBoxLabel(def)));
    return def;
  }
  std::string choices;
  for (int b : buttons) choices += FormatString("%s%s", choices.empty() ? "" : "/", velMessageBoxLabel(b));
  for (;;) {
    auto line = readLine(FormatString("%s <%s> : ", choices.c_str(), velMessageBoxLabel(def)));
    if (!line) return std::find(buttons.begin(), buttons.end(), IDCANCEL) != buttons.end() ? IDCANCEL : def;
    if (line->text.empty()) return def;
    for (int b : buttons)
      if (EqualsNoCase(line->text, velMessageBoxLabel(b)) ||
          EqualsNoCase(line->text, FirstChars(velMessageBoxLabel(b), 1)))
        return b;
    print(FormatString("Réponse attendue : %s.\n", choices.c_str()));
  }
}

// ---- script ----

std::optional<std::string> velStripScriptComment(const std::string& line) {
  std::string text = line;
  if (!text.empty() && text.back() == '\r') text.pop_back();
  const auto first = text.find_first_not_of(" \t");
  if (first != std::string::npos && text[first] == ';') return std::nullopt;
  for (std::size_t i = 1; i < text.size(); ++i) {
    if (text[i] == ';' && (text[i - 1] == ' ' || text[i - 1] == '\t')) {
      text.erase(i);
      break;
    }
  }
  const auto last = text.find_last_not_of(" \t\r");
  text.erase(last == std::string::npos ? 0 : last + 1);
  return text;
}

VelScriptedUI::VelScriptedUI(std::istream& script, std::ostream& out, std::string scriptName)
    : script_(script), out_(out), name_(std::move(scriptName)) {}

void VelScriptedUI::print(const std::string& text) {
  out_ << text;
  out_.flush();
}

std::optional<VelInputLine> VelScriptedUI::readRawLine(const std::string& prompt) {
  std::string raw;
  while (std::getline(script_, raw)) {
    ++line_;
    std::optional<std::string> text = velStripScriptComment(raw);
    if (!text) continue;
    // The transcript shows the prompt and its answer, as a user would have seen them.
    print(prompt + *text + "\n");
    if (*text == "^C") return std::nullopt;
    return VelInputLine{*text, line_};
  }
  ended_ = true;
  return std::nullopt;
}

int VelScriptedUI::messageBox(const VelMessageBox& box) {
  const int answer = velMessageBoxDefault(box.style);
  print(velMessageBoxTranscript(box) + FormatString("<%s>\n", velMessageBoxLabel(answer)));
  return answer;
}

// ---- current back-end ----

namespace {

VelUserInterface*& Installed() {
  static VelUserInterface* ui = nullptr;
  return ui;
}

VelUserInterface& DefaultUI() {
  static VelTerminalUI* ui = new VelTerminalUI(std::cin, std::cout, false);
  return *ui;
}

}  // namespace

VelUserInterface& velUI() {
  VelUserInterface* ui = Installed();
  return ui ? *ui : DefaultUI();
}

VelUserInterface* velSetUI(VelUserInterface* ui) {
  VelUserInterface* previous = Installed();
  Installed() = ui;
  return previous;
}

int velMessageBox(const std::string& caption, const std::string& text, unsigned style) {
  return velUI().messageBox({caption, text, style});
}
