const typeNames = [
    'bool', 'int', 'uint', 'double', 'string', 'ustring',
    'boolArray', 'intArray', 'uintArray', 'doubleArray', 'stringArray', 'ustringArray',
];
const isArray = (type) => type.endsWith('Array');
const elementType = (type) => (isArray(type) ? type.slice(0, -'Array'.length) : type);
const isText = (type) => elementType(type).endsWith('string');

const sameValue = (one, other) => JSON.stringify(one) === JSON.stringify(other);

/// The content of a value on one line, for people.
function showContent(content) {
    if (Array.isArray(content)) return content.map(showContent).join(', ');
    return String(content).replaceAll('\r\n', '↵').replaceAll(/[\r\n]/g, '↵');
}

/// A value on one line as an element; what would be invisible is said.
function valueElement(value) {
    const { value: content } = value;
    if (Array.isArray(content) && content.length === 0) {
        return element('span', { class: 'muted' }, 'no elements');
    }
    const text = showContent(content);
    if (text === '') return element('span', { class: 'muted' }, 'empty text');
    return element('span', { class: 'value' }, text);
}

/// A value as long as it is.
function wholeValue(value) {
    if (!Array.isArray(value.value) || value.value.length === 0) {
        const shown = valueElement(value);
        if (shown.className === 'value') shown.textContent = String(value.value);
        return shown;
    }
    const items = value.value.map((item) => element('li', {}, String(item) || '\u00a0'));
    return element('ol', { class: 'value', start: '0' }, ...items);
}

/// Whether the plain form of a field would not give back the same value: its lines are elements, and
/// a browser makes one kind of line end of all.
function needsJson(value) {
    if (!isText(value.type)) return false;
    if (!isArray(value.type)) return value.value.includes('\r');
    return value.value.some((item) => /[\r\n]/.test(item)) || sameValue(value.value, ['']);
}

const numberForms = {
    int: { lowest: -2147483648, highest: 2147483647 },
    uint: { lowest: 0, highest: 4294967295 },
};

function readNumber(type, text) {
    const number = Number(text);
    const form = numberForms[type];
    if (form === undefined) {
        if (text !== '' && Number.isFinite(number)) return number;
        throw new RangeError(`“${text}” is not a number.`);
    }
    if (/^[+-]?\d+$/.test(text) && number >= form.lowest && number <= form.highest) return number;
    throw new RangeError(
        `“${text}” is not a whole number from ${form.lowest} to ${form.highest}.`);
}

function readElement(type, text) {
    if (type === 'bool') {
        if (text.trim() === 'true') return true;
        if (text.trim() === 'false') return false;
        throw new RangeError(`“${text}” is neither true nor false.`);
    }
    return isText(type) ? text : readNumber(type, text.trim());
}

function linesOf(type, text) {
    const lines = text === '' ? [] : text.split('\n');
    return isText(type) ? lines : lines.filter((line) => line.trim() !== '');
}

function readJson(type, text) {
    let content;
    try {
        content = JSON.parse(text);
    } catch (problem) {
        throw new RangeError(`That is not JSON: ${problem.message}`);
    }
    if (Array.isArray(content) !== isArray(type)) {
        throw new RangeError(isArray(type) ? 'A JSON array is needed.' : 'A JSON text is needed.');
    }
    const wanted = isText(type) ? 'string' : elementType(type) === 'bool' ? 'boolean' : 'number';
    const wrong = [content].flat().find((item) => typeof item !== wanted);
    if (wrong !== undefined) throw new RangeError(`${JSON.stringify(wrong)} is not a ${wanted}.`);
    if (wanted === 'number') [content].flat().forEach((item) => readNumber(elementType(type), String(item)));
    return content;
}

/// The value that the text of a field means; throws RangeError with what to say.
function readValue(type, text, asJson) {
    if (asJson) return { type, value: readJson(type, text) };
    if (!isArray(type)) return { type, value: readElement(type, text) };
    return { type, value: linesOf(type, text).map((line) => readElement(elementType(type), line)) };
}

/// The text of a field for a value.
function writeValue(value, asJson) {
    if (asJson) return JSON.stringify(value.value, null, isArray(value.type) ? 1 : 0);
    return isArray(value.type) ? value.value.join('\n') : String(value.value);
}
