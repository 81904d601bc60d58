#include "host/console/LineEditor.hpp"

#include <histedit.h>
#include <poll.h>
#include <unistd.h>

#include <algorithm>
#include <cstddef>
#include <cstdio>
#include <stdexcept>
#include <string_view>
#include <utility>
#include <vector>

#include "host/TerminalText.hpp"
#include "host/console/Interruption.hpp"
#include "host/console/SignalPause.hpp"

namespace velkor::host {

namespace {

constexpr int historySize = 1000;
constexpr std::size_t mostShownWords = 100;

struct EditLineDeleter {
    void operator()(EditLine* editor) const { el_end(editor); }
};

struct HistoryDeleter {
    void operator()(History* lines) const { history_end(lines); }
};

// Clears the row from the cursor on, as nearly every terminal knows it.
constexpr std::string_view clearing = "\x1b[K";

const char* prompt(EditLine*) {
    return "velkor> ";
}

}  // namespace

/// The editing library's objects, and the functions that it calls back.
class LineEditor::Session {
public:
    Session(Complete completeLine, Announcements& shownAnnouncements, Memory&& memory)
        : complete(std::move(completeLine)),
          announcements(shownAnnouncements),
          remember(std::move(memory.remember)),
          lines(history_init()),
          editor(el_init("velkor-config", stdin, stdout, stderr)) {
        if (!lines || !editor) {
            throw std::runtime_error("The terminal can't be used for line editing.");
        }
        HistEvent event;
        history(lines.get(), &event, H_SETSIZE, historySize);
        history(lines.get(), &event, H_SETUNIQUE, 1);
        for (const auto& line : memory.earlierLines) enter(line + '\n');
        el_set(editor.get(), EL_CLIENTDATA, this);
        el_set(editor.get(), EL_PROMPT, prompt);
        el_set(editor.get(), EL_EDITOR, "emacs");
        el_set(editor.get(), EL_SIGNAL, 1);
        el_set(editor.get(), EL_HIST, history, lines.get());
        el_wset(editor.get(), EL_GETCFN, onCharacter);
        bindKeys();
    }

    std::optional<std::string> read() {
        // The editing library loses the terminal's mode to SIGINT, and its own memory to a new size
        // of the terminal in the middle of a line: it learns the size between two lines.
        const SignalPause pause{SIGINT, SIGWINCH};
        el_resize(editor.get());
        const Editing editing(announcements);
        do {
            cancelled = false;
            int length = 0;
            // Those that end or stop the program wait until the library is there to put the
            // terminal right.
            untilLibraryListens.emplace(
                std::initializer_list<int>{SIGHUP, SIGQUIT, SIGTERM, SIGTSTP});
            // Before the prompt invites anybody to type: Ctrl-C would end the program otherwise.
            el_set(editor.get(), EL_PREP_TERM, 1);
            const char* text = el_gets(editor.get(), &length);
            untilLibraryListens.reset();
            if (cancelled) {
                std::fputs("^C\n", stdout);
            } else if (text == nullptr || length <= 0) {
                std::fputs("\n", stdout);
                return std::nullopt;
            } else {
                return remembered(std::string(text, static_cast<std::size_t>(length)));
            }
        } while (true);
    }

private:
    /// A line is being edited while it lives.
    class Editing {
    public:
        explicit Editing(Announcements& kept) : announcements(kept) {
            announcements.beginEditing();
        }
        ~Editing() { announcements.endEditing(); }

        Editing(const Editing&) = delete;
        Editing& operator=(const Editing&) = delete;

    private:
        Announcements& announcements;
    };

    void bindKeys() {
        // The narrow form of this call copies the texts and never frees them.
        el_wset(editor.get(), EL_ADDFN, L"velkor-complete", L"Complete the word", onComplete);
        el_wset(editor.get(), EL_ADDFN, L"velkor-cancel", L"Drop the line", onCancel);
        el_source(editor.get(), nullptr);
        el_set(editor.get(), EL_BIND, "^I", "velkor-complete", nullptr);
        // While a line is edited, Ctrl-C is a key like any other and sends no signal.
        el_set(editor.get(), EL_SETTY, "-d", "-isig", nullptr);
        el_set(editor.get(), EL_BIND, "^C", "velkor-cancel", nullptr);
    }

    // The editing library keeps lines with their ends.
    void enter(const std::string& line) {
        HistEvent event;
        history(lines.get(), &event, H_ENTER, line.c_str());
    }

    std::string remembered(std::string line) {
        const bool isKept = line != "\n" && line.front() != ' ' && line.front() != '\t';
        if (isKept) enter(line);
        if (line.back() == '\n') line.pop_back();
        if (isKept && remember) remember(line);
        return line;
    }

    static Session& of(EditLine* editor) {
        void* session = nullptr;
        el_get(editor, EL_CLIENTDATA, &session);
        return *static_cast<Session*>(session);
    }

    // Reads one character, and shows what is announced before it comes.
    static int onCharacter(EditLine* editor, wchar_t* character) {
        Session& session = of(editor);
        session.untilLibraryListens.reset();
        while (!session.keyIsNext()) session.showAnnouncements();
        // The library's own way to read knows its signals and all characters.
        el_wset(editor, EL_GETCFN, static_cast<el_rfunc_t>(EL_BUILTIN_GETCFN));
        const int count = el_wgetc(editor, character);
        el_wset(editor, EL_GETCFN, onCharacter);
        // What came before the line's last key is not about the command; what comes once that key
        // has made the terminal ordinary again is.
        Interruption::forget();
        return count;
    }

    // Waits for the next key or announcement; gives whether it is a key, or the end of them.
    bool keyIsNext() const {
        pollfd awaited[] = {{STDIN_FILENO, POLLIN, 0}, {announcements.descriptor(), POLLIN, 0}};
        while (::poll(awaited, 2, -1) < 0) continue;
        return awaited[0].revents != 0;
    }

    void showAnnouncements() {
        std::fputs(canBeCleared() ? ("\r" + std::string(clearing)).c_str() : "\n", stdout);
        std::fflush(stdout);
        announcements.show();
        el_set(editor.get(), EL_REFRESH);
    }

    // Whether nothing need stay on the screen of the line that is edited: it has one row, and the
    // terminal the usual way to clear that.
    bool canBeCleared() const {
        const char* known = nullptr;
        int columns = 0;
        el_get(editor.get(), EL_GETTC, "ce", &known);
        el_get(editor.get(), EL_GETTC, "co", &columns);
        const LineInfo* line = el_line(editor.get());
        const std::string_view typed(line->buffer,
                                     static_cast<std::size_t>(line->lastchar - line->buffer));
        const std::size_t width = characterCount(prompt(nullptr)) + characterCount(typed);
        return known != nullptr && std::string_view(known) == clearing &&
               width < static_cast<std::size_t>(columns);
    }

    static unsigned char onCancel(EditLine* editor, int) {
        of(editor).cancelled = true;
        return CC_NEWLINE;
    }

    static unsigned char onComplete(EditLine* editor, int) {
        // The editing library is no place for an exception to pass through.
        try {
            return of(editor).completeWord();
        } catch (...) {
            return CC_ERROR;
        }
    }

    unsigned char completeWord() {
        const LineInfo* line = el_line(editor.get());
        const Completion completion = complete(std::string(line->buffer, line->cursor));
        if (completion.words.empty()) return CC_REFRESH_BEEP;
        std::string addition = completion.commonAddition();
        const bool isWhole = completion.words.size() == 1 && completion.words[0].back() != '/';
        if (isWhole) addition += ' ';
        if (addition.empty()) return show(completion.words);
        return el_insertstr(editor.get(), addition.c_str()) == 0 ? CC_REFRESH : CC_ERROR;
    }

    static unsigned char show(const std::vector<std::string>& words) {
        std::string list = "\n";
        for (std::size_t i = 0; i < std::min(words.size(), mostShownWords); ++i) {
            list += escapedForTerminal(words[i], LineFeeds::escaped) + '\n';
        }
        if (words.size() > mostShownWords) {
            list += "... and " + std::to_string(words.size() - mostShownWords) + " more\n";
        }
        std::fputs(list.c_str(), stdout);
        return CC_REDISPLAY;
    }

    const Complete complete;
    Announcements& announcements;
    const std::function<void(const std::string&)> remember;
    const std::unique_ptr<History, HistoryDeleter> lines;
    const std::unique_ptr<EditLine, EditLineDeleter> editor;
    bool cancelled = false;
    std::optional<SignalPause> untilLibraryListens;
    const Interruption interruption;
};

LineEditor::LineEditor(Complete complete, Announcements& announcements, Memory memory)
    : session(std::make_unique<Session>(std::move(complete), announcements, std::move(memory))) {}

LineEditor::~LineEditor() = default;

std::optional<std::string> LineEditor::nextLine() {
    return session->read();
}

}  // namespace velkor::host
