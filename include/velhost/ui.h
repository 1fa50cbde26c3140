// The host's user-interface layer: command-line output and input, message boxes and
// file prompts, behind one interface with a terminal and a scripted back-end, so that
// every dialog also runs from a script.
#pragma once

#include <deque>
#include <iosfwd>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "velhost/read_result.h"

#pragma GCC visibility push(default)

// Message box styles and answers, with the values the module passes and expects.
constexpr unsigned MB_OK = 0x0;
constexpr unsigned MB_OKCANCEL = 0x1;
constexpr unsigned MB_ABORTRETRYIGNORE = 0x2;
constexpr unsigned MB_YESNOCANCEL = 0x3;
constexpr unsigned MB_YESNO = 0x4;
constexpr unsigned MB_RETRYCANCEL = 0x5;
constexpr unsigned MB_ICONERROR = 0x10;
constexpr unsigned MB_ICONQUESTION = 0x20;
constexpr unsigned MB_ICONWARNING = 0x30;
constexpr unsigned MB_ICONINFORMATION = 0x40;
constexpr unsigned MB_DEFBUTTON2 = 0x100;
constexpr unsigned MB_DEFBUTTON3 = 0x200;
constexpr int IDOK = 1;
constexpr int IDCANCEL = 2;
constexpr int IDABORT = 3;
constexpr int IDRETRY = 4;
constexpr int IDIGNORE = 5;
constexpr int IDYES = 6;
constexpr int IDNO = 7;

// One message box as a module asks for it.
struct VelMessageBox {
    std::string caption;
    std::string text;
    unsigned style = MB_OK;
};

// The buttons of a style, in screen order, and the one a plain Enter chooses.
std::vector<int> velMessageBoxButtons(unsigned style);
int velMessageBoxDefault(unsigned style);
// French label of a button answer ("OK", "Annuler", "Oui", "Non"...).
const char* velMessageBoxLabel(int answer);
// The box as the output shows it: caption with its kind, then the text.
std::string velMessageBoxTranscript(const VelMessageBox& box);

class CVelDialog;

// A line read from the user, with where it came from (for messages).
struct VelInputLine {
    std::string text;
    int lineNumber = 0; // 0 when not from a script
};

class VelUserInterface {
public:
    virtual ~VelUserInterface();
    // Command-line output, as acutPrintf produces it.
    virtual void print(const std::string& text) = 0;
    // One line for a prompt (command prompt, keyword, file name...); nullopt when the user
    // cancels or the input has ended.
    std::optional<VelInputLine> readLine(const std::string& prompt);
    // Shows a message box and answers the chosen button (IDOK...).
    virtual int messageBox(const VelMessageBox& box) = 0;
    // True when nobody is there to answer (answers come from a script).
    virtual bool isScripted() const = 0;
    // Runs a modal dialog to its end and answers IDOK or IDCANCEL; by default through
    // the line view of velhost/dialog.h.
    virtual int runDialog(CVelDialog& dialog);
    // True once the input has ended (a readLine answering nullopt then means "no more
    // input" rather than a cancelled prompt).
    bool inputEnded() const { return ended_; }
    // True when the last readLine answered nullopt because the user asked to end (Ctrl-D
    // on an empty line in a terminal); later prompts still read.
    bool endRequested() const { return endRequested_; }
    // Words given on the command line after a command name: the next prompts take them
    // first, as a script does.
    void pushPendingInput(const std::vector<std::string>& words);
    // Drops the pending words and answers how many there were.
    std::size_t dropPendingInput();

protected:
    virtual std::optional<VelInputLine> readRawLine(const std::string& prompt) = 0;
    bool ended_ = false;
    bool endRequested_ = false;

private:
    std::deque<std::string> pending_;
};

// Interactive use: standard output, line editing with history when the input is a
// terminal, message boxes asked on the command line. With line editing, Ctrl-C cancels
// the prompt (and is ignored between prompts, so that it never ends the host), and
// Ctrl-D on an empty line answers nullopt with endRequested().
class VelTerminalUI : public VelUserInterface {
public:
    // lineEditing: the line editor on the process's standard input and output (which must
    // be a terminal); in and out serve otherwise.
    VelTerminalUI(std::istream& in, std::ostream& out, bool lineEditing);
    ~VelTerminalUI() override;
    void print(const std::string& text) override;
    int messageBox(const VelMessageBox& box) override;
    bool isScripted() const override { return false; }
    // The dialog on the whole screen (velRunDialogScreen); what is printed meanwhile is
    // shown once the screen is left.
    int runDialog(CVelDialog& dialog) override;
    // The line history of earlier sessions (line editing only); a missing file is no error.
    void loadHistory(const std::string& fileName);
    bool saveHistory(const std::string& fileName) const;

protected:
    std::optional<VelInputLine> readRawLine(const std::string& prompt) override;

private:
    class LineEditor;
    std::istream& in_;
    std::ostream& out_;
    std::unique_ptr<LineEditor> editor_;
    std::string held_;
};

// Makes the character type UTF-8 for its lifetime: the user's locale when it is UTF-8,
// else C.UTF-8, restoring the previous one after. Terminal libraries need it to show and
// read accented text; numbers stay locale-free (LC_NUMERIC is never touched).
class VelUtf8CharacterType {
public:
    VelUtf8CharacterType();
    ~VelUtf8CharacterType();
    VelUtf8CharacterType(const VelUtf8CharacterType&) = delete;
    VelUtf8CharacterType& operator=(const VelUtf8CharacterType&) = delete;
    // The UTF-8 locale chosen ("" when the system has none).
    static const std::string& localeName();

private:
    std::string previous_;
};

// A command script (".scr"): each line is what the user would type; a prompt takes the
// next line; a line starting with ";" is a comment, and " ;" ends a line early; "^C"
// cancels the prompt it answers. Message boxes take their default button and are
// written to the output.
class VelScriptedUI : public VelUserInterface {
public:
    VelScriptedUI(std::istream& script, std::ostream& out, std::string scriptName);
    void print(const std::string& text) override;
    int messageBox(const VelMessageBox& box) override;
    bool isScripted() const override { return true; }
    // Line number of the last line read (0 before the first).
    int currentLine() const { return line_; }
    const std::string& scriptName() const { return name_; }
    // How the reading went: a failure when an input error ended the script before its end.
    const VelReadResult& readResult() const { return read_; }

protected:
    std::optional<VelInputLine> readRawLine(const std::string& prompt) override;

private:
    std::istream& script_;
    std::ostream& out_;
    std::string name_;
    int line_ = 0;
    VelReadResult read_;
};

// The script line without its comment, or nullopt for a line that is only a comment.
std::optional<std::string> velStripScriptComment(const std::string& line);

// The environment ("NAME=value" entries) for a terminal program the host starts, such as
// a text editor: the process's own, with a UTF-8 character type when the user's locale
// is not UTF-8, so that the program shows and writes the host's UTF-8 text as it is.
std::vector<std::string> velTerminalProgramEnvironment();

// The back-end in use (a terminal on standard input/output until one is installed).
VelUserInterface& velUI();
// Installs a back-end (null restores the default) and answers the previous one; the
// caller keeps ownership.
VelUserInterface* velSetUI(VelUserInterface* ui);

// Message box through the current back-end.
int velMessageBox(const std::string& caption, const std::string& text, unsigned style);

#pragma GCC visibility pop
