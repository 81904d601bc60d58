#include "host/console/LineEditor.hpp"

#include <histedit.h>

#include <algorithm>
#include <cstddef>
#include <cstdio>
#include <stdexcept>
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

const char* prompt(EditLine*) {
    return "velkor> ";
}

}  // namespace

/// The editing library's objects, and the functions that it calls back.
class LineEditor::Session {
public:
    explicit Session(Complete completeLine)
        : complete(std::move(completeLine)),
          lines(history_init()),
          editor(el_init("velkor-config", stdin, stdout, stderr)) {
        if (!lines || !editor) {
            throw std::runtime_error("The terminal can't be used for line editing.");
        }
        HistEvent event;
        history(lines.get(), &event, H_SETSIZE, historySize);
        history(lines.get(), &event, H_SETUNIQUE, 1);
        el_set(editor.get(), EL_CLIENTDATA, this);
        el_set(editor.get(), EL_PROMPT, prompt);
        el_set(editor.get(), EL_EDITOR, "emacs");
        el_set(editor.get(), EL_SIGNAL, 1);
        el_set(editor.get(), EL_HIST, history, lines.get());
        bindKeys();
    }

    std::optional<std::string> read() {
        // The editing library loses the terminal's mode to SIGINT, and its own memory to a new size
        // of the terminal in the middle of a line: it learns the size between two lines.
        const SignalPause pause{SIGINT, SIGWINCH};
        el_resize(editor.get());
        do {
            cancelled = false;
            int length = 0;
            // Before the prompt invites anybody to type: Ctrl-C would end the program otherwise.
            el_set(editor.get(), EL_PREP_TERM, 1);
            const char* text = el_gets(editor.get(), &length);
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

    std::string remembered(std::string line) {
        HistEvent event;
        if (line != "\n") history(lines.get(), &event, H_ENTER, line.c_str());
        if (line.back() == '\n') line.pop_back();
        return line;
    }

    static Session& of(EditLine* editor) {
        void* session = nullptr;
        el_get(editor, EL_CLIENTDATA, &session);
        return *static_cast<Session*>(session);
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
        if (completion.words.size() == 1) addition += ' ';
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
    const std::unique_ptr<History, HistoryDeleter> lines;
    const std::unique_ptr<EditLine, EditLineDeleter> editor;
    bool cancelled = false;
    const Interruption interruption;
};

LineEditor::LineEditor(Complete complete)
    : session(std::make_unique<Session>(std::move(complete))) {}

LineEditor::~LineEditor() = default;

std::optional<std::string> LineEditor::nextLine() {
    return session->read();
}

}  // namespace velkor::host
