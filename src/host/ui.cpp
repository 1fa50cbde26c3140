// The two user-interface back-ends: a terminal (line editing and history when the
// input is one) and a command script whose lines answer every prompt.
#include "velhost/ui.h"

#include <histedit.h>
#include <langinfo.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <clocale>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>

#include "host_internal.h"
#include "text/text.hpp"
#include "velhost/dialog.h"

std::vector<int> velMessageBoxButtons(unsigned style)
{
    switch (style & 0xF) {
    case MB_OKCANCEL:
        return {IDOK, IDCANCEL};
    case MB_ABORTRETRYIGNORE:
        return {IDABORT, IDRETRY, IDIGNORE};
    case MB_YESNOCANCEL:
        return {IDYES, IDNO, IDCANCEL};
    case MB_YESNO:
        return {IDYES, IDNO};
    case MB_RETRYCANCEL:
        return {IDRETRY, IDCANCEL};
    default:
        return {IDOK};
    }
}

int velMessageBoxDefault(unsigned style)
{
    const std::vector<int> buttons = velMessageBoxButtons(style);
    const std::size_t index = (style >> 8) & 0xF;
    return index < buttons.size() ? buttons[index] : buttons.front();
}

const char* velMessageBoxLabel(int answer)
{
    switch (answer) {
    case IDOK:
        return "OK";
    case IDCANCEL:
        return "Annuler";
    case IDABORT:
        return "Abandonner";
    case IDRETRY:
        return "Réessayer";
    case IDIGNORE:
        return "Ignorer";
    case IDYES:
        return "Oui";
    case IDNO:
        return "Non";
    default:
        return "?";
    }
}

std::string velMessageBoxTranscript(const VelMessageBox& box)
{
    const char* kind = "";
    switch (box.style & 0xF0) {
    case MB_ICONERROR:
        kind = " (erreur)";
        break;
    case MB_ICONQUESTION:
        kind = " (question)";
        break;
    case MB_ICONWARNING:
        kind = " (avertissement)";
        break;
    case MB_ICONINFORMATION:
        kind = " (information)";
        break;
    default:
        break;
    }
    return FormatString("\n[%s%s]\n%s\n", box.caption.c_str(), kind, box.text.c_str());
}

// ---- base ----

VelUserInterface::~VelUserInterface() = default;

std::optional<VelInputLine> VelUserInterface::readLine(const std::string& prompt)
{
    endRequested_ = false;
    if (!pending_.empty()) {
        VelInputLine line{pending_.front(), 0};
        pending_.pop_front();
        print(prompt + line.text + "\n");
        return line;
    }
    return readRawLine(prompt);
}

void VelUserInterface::pushPendingInput(const std::vector<std::string>& words)
{
    pending_.insert(pending_.end(), words.begin(), words.end());
}

std::size_t VelUserInterface::dropPendingInput()
{
    const std::size_t n = pending_.size();
    pending_.clear();
    return n;
}

// ---- character type ----

namespace {

bool CodesetIsUtf8()
{
    const char* codeset = nl_langinfo(CODESET);
    return codeset != nullptr && (EqualsNoCase(codeset, "UTF-8") || EqualsNoCase(codeset, "utf8"));
}

std::string ChooseUtf8Locale()
{
    const char* current = std::setlocale(LC_CTYPE, nullptr);
    const std::string previous = current ? current : "C";
    std::string chosen;
    for (const char* name : {"", "C.UTF-8", "C.utf8", "en_US.UTF-8"}) {
        const char* set = std::setlocale(LC_CTYPE, name);
        if (set != nullptr && CodesetIsUtf8()) {
            chosen = set;
            break;
        }
    }
    std::setlocale(LC_CTYPE, previous.c_str());
    return chosen;
}

} // namespace

const std::string& VelUtf8CharacterType::localeName()
{
    static const std::string name = ChooseUtf8Locale();
    return name;
}

VelUtf8CharacterType::VelUtf8CharacterType()
{
    const char* current = std::setlocale(LC_CTYPE, nullptr);
    if (localeName().empty() || current == nullptr || CodesetIsUtf8())
        return;
    previous_ = current;
    std::setlocale(LC_CTYPE, localeName().c_str());
}

VelUtf8CharacterType::~VelUtf8CharacterType()
{
    if (!previous_.empty())
        std::setlocale(LC_CTYPE, previous_.c_str());
}

namespace {

// The value a program started now would take for its character type.
std::string EnvironmentCharacterType()
{
    for (const char* name : {"LC_ALL", "LC_CTYPE", "LANG"}) {
        const char* value = std::getenv(name);
        if (value != nullptr && *value != '\0')
            return value;
    }
    return "C";
}

bool LocaleIsUtf8(const std::string& name)
{
    locale_t locale = newlocale(LC_CTYPE_MASK, name.c_str(), static_cast<locale_t>(0));
    if (locale == static_cast<locale_t>(0))
        return false;
    const char* codeset = nl_langinfo_l(CODESET, locale);
    const bool utf8 = codeset != nullptr && (EqualsNoCase(codeset, "UTF-8") || EqualsNoCase(codeset, "utf8"));
    freelocale(locale);
    return utf8;
}

} // namespace

std::vector<std::string> velTerminalProgramEnvironment()
{
    std::vector<std::string> environment;
    const std::string& utf8 = VelUtf8CharacterType::localeName();
    const bool change = !utf8.empty() && !LocaleIsUtf8(EnvironmentCharacterType());
    const char* all = std::getenv("LC_ALL");
    const bool moveAll = change && all != nullptr && *all != '\0';
    auto starts = [](const char* entry, const char* name) { return std::strncmp(entry, name, std::strlen(name)) == 0; };
    for (char** entry = environ; entry != nullptr && *entry != nullptr; ++entry) {
        if (change &&
            (starts(*entry, "LC_CTYPE=") || starts(*entry, "LC_ALL=") || (moveAll && starts(*entry, "LANG="))))
            continue;
        environment.emplace_back(*entry);
    }
    // LC_ALL would override the character type: its value becomes LANG, so that the
    // program keeps the user's language for its messages.
    if (moveAll)
        environment.push_back(std::string("LANG=") + all);
    if (change)
        environment.push_back("LC_CTYPE=" + utf8);
    return environment;
}

// ---- terminal line editing ----

namespace {

static_assert(sizeof(wchar_t) == sizeof(char32_t), "the line editor's characters are code points");

volatile std::sig_atomic_t g_interrupted = 0;

extern "C" void NoteInterrupt(int)
{
    g_interrupted = 1;
}

std::wstring WideText(const std::string& text)
{
    const std::u32string points = DecodeUtf8(text);
    std::wstring wide;
    wide.reserve(points.size());
    // The editor draws every character itself: a control character would move its idea of
    // the cursor away from the screen's.
    for (char32_t c : points)
        wide += (c < 0x20 || (c >= 0x7F && c < 0xA0)) ? L'\uFFFD' : static_cast<wchar_t>(c);
    return wide;
}

} // namespace

// The line editor: libedit's own interface in wide characters, so that no prompt goes
// through the C library's multibyte conversion (which fails, and crashed libedit, on
// accented text in the "C" locale).
class VelTerminalUI::LineEditor {
public:
    enum class End { kLine, kCancelled, kEndKey, kInputEnded };

    LineEditor()
    {
        VelUtf8CharacterType utf8;
        history_ = history_winit();
        el_ = el_init("velhost", stdin, stdout, stderr);
        if (history_ == nullptr || el_ == nullptr)
            return;
        HistEventW event;
        history_w(history_, &event, H_SETSIZE, 1000);
        history_w(history_, &event, H_SETUNIQUE, 1);
        el_wset(el_, EL_CLIENTDATA, this);
        el_wset(el_, EL_EDITOR, L"emacs");
        el_wset(el_, EL_SIGNAL, 1);
        el_wset(el_, EL_PROMPT, &Prompt);
        el_wset(el_, EL_HIST, history_w, history_);
        // Ctrl-C reaches the editor as a key, which cancels the prompt; between prompts it
        // is noted and ignored, so that it never ends the host with drawings open.
        el_wset(el_, EL_SETTY, L"-d", L"-isig", nullptr);
        el_wset(el_, EL_ADDFN, L"vel-annuler", L"annule la saisie", &CancelKey);
        el_wset(el_, EL_BIND, L"^C", L"vel-annuler", nullptr);
        struct sigaction note {};
        note.sa_handler = NoteInterrupt;
        sigemptyset(&note.sa_mask);
        sigaction(SIGINT, &note, &previousInterrupt_);
    }

    ~LineEditor()
    {
        if (el_ != nullptr) {
            sigaction(SIGINT, &previousInterrupt_, nullptr);
            VelUtf8CharacterType utf8;
            el_end(el_);
        }
        if (history_ != nullptr)
            history_wend(history_);
    }

    LineEditor(const LineEditor&) = delete;
    LineEditor& operator=(const LineEditor&) = delete;

    bool ready() const { return el_ != nullptr && history_ != nullptr; }

    End read(const std::string& prompt, std::string& line)
    {
        VelUtf8CharacterType utf8;
        prompt_ = WideText(prompt);
        cancelling_ = cancelled_ = false;
        g_interrupted = 0;
        int count = 0;
        errno = 0;
        const wchar_t* got = el_wgets(el_, &count);
        const int error = errno;
        if (cancelled_ || g_interrupted)
            return End::kCancelled;
        if (got == nullptr) {
            if (count == 0)
                return End::kEndKey;
            return error == EINTR ? End::kCancelled : End::kInputEnded;
        }
        std::u32string points(got, got + count);
        while (!points.empty() && (points.back() == U'\n' || points.back() == U'\r'))
            points.pop_back();
        if (!points.empty()) {
            HistEventW event;
            const std::wstring entry(points.begin(), points.end());
            history_w(history_, &event, H_ENTER, entry.c_str());
        }
        line = EncodeUtf8(points);
        return End::kLine;
    }

    void loadHistory(const std::string& fileName)
    {
        VelUtf8CharacterType utf8;
        HistEventW event;
        history_w(history_, &event, H_LOAD, fileName.c_str());
    }

    bool saveHistory(const std::string& fileName) const
    {
        VelUtf8CharacterType utf8;
        HistEventW event;
        return history_w(history_, &event, H_SAVE, fileName.c_str()) >= 0;
    }

private:
    static LineEditor* Self(EditLine* el)
    {
        void* self = nullptr;
        el_wget(el, EL_CLIENTDATA, &self);
        return static_cast<LineEditor*>(self);
    }

    static wchar_t* Prompt(EditLine* el) { return Self(el)->prompt_.data(); }

    // The first press moves to the end of the line, so that what follows is written after
    // it, and comes back through the same key to end the read.
    static unsigned char CancelKey(EditLine* el, int)
    {
        LineEditor* self = Self(el);
        if (!self->cancelling_) {
            self->cancelling_ = true;
            const LineInfoW* info = el_wline(el);
            el_cursor(el, static_cast<int>(info->lastchar - info->cursor));
            el_wpush(el, L"\003");
            return CC_CURSOR;
        }
        self->cancelled_ = true;
        return CC_EOF;
    }

    EditLine* el_ = nullptr;
    HistoryW* history_ = nullptr;
    std::wstring prompt_;
    bool cancelling_ = false;
    bool cancelled_ = false;
    struct sigaction previousInterrupt_ {};
};

// ---- terminal ----

VelTerminalUI::VelTerminalUI(std::istream& in, std::ostream& out, bool lineEditing) : in_(in), out_(out)
{
    if (lineEditing) {
        editor_ = std::make_unique<LineEditor>();
        if (!editor_->ready())
            editor_.reset();
    }
}

VelTerminalUI::~VelTerminalUI() = default;

void VelTerminalUI::print(const std::string& text)
{
    if (velDialogScreenShowing()) {
        held_ += text;
        return;
    }
    out_ << held_ << text;
    held_.clear();
    out_.flush();
}

int VelTerminalUI::runDialog(CVelDialog& dialog)
{
    const int result = velRunDialogScreen(dialog, *this);
    if (!held_.empty())
        print({});
    return result;
}

std::optional<VelInputLine> VelTerminalUI::readRawLine(const std::string& prompt)
{
    if (ended_)
        return std::nullopt;
    if (editor_) {
        // The editor keeps the prompt on the same line as what is typed.
        const auto lastBreak = prompt.rfind('\n');
        if (lastBreak != std::string::npos)
            print(prompt.substr(0, lastBreak + 1));
        std::string text;
        switch (editor_->read(lastBreak == std::string::npos ? prompt : prompt.substr(lastBreak + 1), text)) {
        case LineEditor::End::kLine:
            return VelInputLine{text, 0};
        case LineEditor::End::kCancelled:
            print("^C\n");
            return std::nullopt;
        case LineEditor::End::kEndKey:
            // The editor has shown "^D".
            print("\n");
            endRequested_ = true;
            return std::nullopt;
        case LineEditor::End::kInputEnded:
            print("\n");
            ended_ = true;
            return std::nullopt;
        }
    }
    print(prompt);
    std::string text;
    if (!std::getline(in_, text)) {
        print("\n");
        ended_ = true;
        return std::nullopt;
    }
    if (!text.empty() && text.back() == '\r')
        text.pop_back();
    return VelInputLine{text, 0};
}

void VelTerminalUI::loadHistory(const std::string& fileName)
{
    if (editor_)
        editor_->loadHistory(fileName);
}

bool VelTerminalUI::saveHistory(const std::string& fileName) const
{
    return !editor_ || editor_->saveHistory(fileName);
}

int VelTerminalUI::messageBox(const VelMessageBox& box)
{
    // A question asked while a dialog holds the screen is asked on the command line.
    velSuspendDialogScreen();
    print(velMessageBoxTranscript(box));
    const std::vector<int> buttons = velMessageBoxButtons(box.style);
    const int def = velMessageBoxDefault(box.style);
    if (buttons.size() == 1) {
        readLine(FormatString("[%s] ", velMessageBoxLabel(def)));
        return def;
    }
    std::string choices;
    for (int b : buttons)
        choices += FormatString("%s%s", choices.empty() ? "" : "/", velMessageBoxLabel(b));
    for (;;) {
        auto line = readLine(FormatString("%s <%s> : ", choices.c_str(), velMessageBoxLabel(def)));
        if (!line)
            return std::find(buttons.begin(), buttons.end(), IDCANCEL) != buttons.end() ? IDCANCEL : def;
        if (line->text.empty())
            return def;
        for (int b : buttons)
            if (EqualsNoCase(line->text, velMessageBoxLabel(b)) ||
                EqualsNoCase(line->text, FirstChars(velMessageBoxLabel(b), 1)))
                return b;
        print(FormatString("Réponse attendue : %s.\n", choices.c_str()));
    }
}

// ---- script ----

std::optional<std::string> velStripScriptComment(const std::string& line)
{
    std::string text = line;
    if (!text.empty() && text.back() == '\r')
        text.pop_back();
    const auto first = text.find_first_not_of(" \t");
    if (first != std::string::npos && text[first] == ';')
        return std::nullopt;
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
    : script_(script), out_(out), name_(std::move(scriptName))
{}

void VelScriptedUI::print(const std::string& text)
{
    out_ << text;
    out_.flush();
}

std::optional<VelInputLine> VelScriptedUI::readRawLine(const std::string& prompt)
{
    std::string raw;
    while (std::getline(script_, raw)) {
        ++line_;
        std::optional<std::string> text = velStripScriptComment(raw);
        if (!text)
            continue;
        // The transcript shows the prompt and its answer, as a user would have seen them.
        print(prompt + *text + "\n");
        if (*text == "^C")
            return std::nullopt;
        return VelInputLine{*text, line_};
    }
    if (script_.bad()) {
        read_ = VelReadResult::Failed(VelReadStatus::kCannotRead, name_, errno != 0 ? errno : EIO);
        read_.line = line_ + 1;
    }
    ended_ = true;
    return std::nullopt;
}

int VelScriptedUI::messageBox(const VelMessageBox& box)
{
    const int answer = velMessageBoxDefault(box.style);
    print(velMessageBoxTranscript(box) + FormatString("<%s>\n", velMessageBoxLabel(answer)));
    return answer;
}

// ---- current back-end ----

namespace {

VelUserInterface*& Installed()
{
    static VelUserInterface* ui = nullptr;
    return ui;
}

VelUserInterface& DefaultUI()
{
    static VelTerminalUI* ui = new VelTerminalUI(std::cin, std::cout, false);
    return *ui;
}

} // namespace

VelUserInterface& velUI()
{
    VelUserInterface* ui = Installed();
    return ui ? *ui : DefaultUI();
}

VelUserInterface* velSetUI(VelUserInterface* ui)
{
    VelUserInterface* previous = Installed();
    Installed() = ui;
    return previous;
}

int velMessageBox(const std::string& caption, const std::string& text, unsigned style)
{
    return velUI().messageBox({caption, text, style});
}
