#pragma once

#include <string>
#include <vector>

#include "framework/common/Mutex.hpp"
#include "host/console/Output.hpp"

namespace velkor::host {

/// Shows what happens while the session goes on, from any thread, in the order in which it was
/// announced: at once, or, while somebody edits a line, when the editor has made room for it.
///
/// Thread-safe. Announcing waits for the output but for no editor.
class Announcements {
public:
    /// Shows texts, lines "KEY = VALUE", as answers of `output`, which must live until `close`.
    explicit Announcements(Output& output);
    ~Announcements();

    Announcements(const Announcements&) = delete;
    Announcements& operator=(const Announcements&) = delete;

    /// Shows `text`, now or soon; drops it once this is closed.
    void announce(const std::string& text) VELKOR_EXCLUDES(mutex);

    /// Touches the output no more, as soon as this returns.
    void close() VELKOR_EXCLUDES(mutex);

    /// A line is being edited: what is announced from now on is kept until `show`.
    void beginEditing() VELKOR_EXCLUDES(mutex);

    /// No line is being edited any more: shows what is there.
    void endEditing() VELKOR_EXCLUDES(mutex);

    /// Shows what is there while a line is being edited.
    void show() VELKOR_EXCLUDES(mutex);

    /// A descriptor that is readable while there is something to show.
    int descriptor() const noexcept { return event; }

private:
    void showPending() VELKOR_REQUIRES(mutex);

    const int event;
    common::Mutex mutex;
    Output* output VELKOR_GUARDED_BY(mutex);
    bool editing VELKOR_GUARDED_BY(mutex) = false;
    std::vector<std::string> pending VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::host
