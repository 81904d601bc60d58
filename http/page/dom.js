const byId = (id) => document.getElementById(id);

/// An element with its attributes; `on…` are listeners, and what is false or undefined is left out.
function element(name, attributes = {}, ...children) {
    const made = document.createElement(name);
    for (const [attribute, content] of Object.entries(attributes)) {
        if (content === false || content === undefined) continue;
        if (attribute.startsWith('on')) made.addEventListener(attribute.slice(2), content);
        else made.setAttribute(attribute, content === true ? '' : content);
    }
    made.append(...children);
    return made;
}

const spokenName = (control) => control.getAttribute('aria-label') ?? control.textContent;

/// Replaces what is in `place`. A button that had the focus passes it on to the one that says the
/// same there now, or to `otherwise`.
function replaceContent(place, content, otherwise) {
    const focused = place.contains(document.activeElement) && document.activeElement;
    place.replaceChildren(...content);
    if (!focused) return;
    const same = [...place.querySelectorAll('button')]
        .find((button) => spokenName(button) === spokenName(focused));
    (same ?? otherwise).focus();
}

const countOf = (number, one, many = `${one}s`) =>
    `${number.toLocaleString('en')} ${number === 1 ? one : many}`;

const clock = (when) => when.toLocaleTimeString('en-GB');

/// A point in time of the server's, RFC 3339, as the reader's own clock shows it.
function timeElement(text) {
    const when = new Date(text);
    if (Number.isNaN(when.getTime())) return element('span', {}, text);
    const sameDay = when.toDateString() === new Date().toDateString();
    const shown = sameDay ? clock(when) : `${when.toLocaleDateString('sv')} ${clock(when)}`;
    return element('time', { datetime: text, title: text }, shown);
}

/// Calls `action` once, `pause` milliseconds after the first of a burst of calls.
function batched(pause, action) {
    let timer;
    return () => {
        timer ??= setTimeout(() => {
            timer = undefined;
            action();
        }, pause);
    };
}
