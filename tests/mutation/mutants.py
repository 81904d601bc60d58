"""The mutants of a C++ source: small changes, each of which some test has to notice.

Works on the text, which clang-format keeps regular: comparison and logical operators stand between
blanks, template brackets don't, and a statement begins on a line of its own or behind a condition.
A change that makes no sense does not compile and counts for nothing."""

import re
from collections import namedtuple

# The bytes from `begin` to `end` of the source are replaced by `text`. `operator` names the kind.
Mutant = namedtuple("Mutant", "begin end text operator")

OPERATORS = ("negate", "shift", "shorten", "retarget", "drop", "lock", "swap")

_LITERALS = re.compile(r"//[^\n]*|/\*.*?\*/|^[ \t]*#[^\n]*(?:\\\n[^\n]*)*"
                       r"|\"(?:\\.|[^\"\\\n])*\"|(?<!\w)'(?:\\.|[^'\\\n])+'", re.S | re.M)
_DECLARATION = re.compile(r"(?:const\s+)?auto\s*[&*]?\s*(\w+)\s*=")
# A condition that is negated where it compares or negates, or that isn't there.
_SINGLE = re.compile(r"$|(?!.*(?:&&|\|\|))(?:!|.* [!=]= )", re.S)
_OTHER_STATEMENTS = re.compile(
    r"(?:return|using|if|for|while|case|default|break|continue|throw|struct|class|enum|public|private"
    r"|protected|static|static_assert|typedef|friend|template|namespace|switch|else|do|try|catch"
    r"|explicit|virtual|extern|inline|operator)\b")
# What takes, gives back or waits for a lock, and what wakes or tells others.
_LOCKS = re.compile(r"\b(?:MutexLock|Level|Operation|lock_guard|unique_lock)\b|(?:\.|->)(?:un)?lock\(\)"
                    r"|(?:\.|->)wait\(|\bnotify(?:_all|_one)?\(|\bgiveBack\(|\btakeBack\(")
_TAKEN = re.compile(r"\b(?:MutexLock|Level|Operation|lock_guard|unique_lock)\b")
_COMPARISONS = {"<": "<=", "<=": "<", ">": ">=", ">=": ">", "==": "!=", "!=": "=="}


def _blank(match):
    kept = match.group()[0] if match.group()[0] in "\"'" else " "
    inner = re.sub(r"[^\n]", " ", match.group()[1:-1])
    return kept + inner + (kept if len(match.group()) > 1 else "")


def masked(source):
    """The source with comments, directives and what stands between quotes blanked out."""
    return _LITERALS.sub(_blank, source)


def closing(code, start):
    """The position of the bracket that closes the one at `start`, or -1."""
    depth = 0
    for position in range(start, len(code)):
        depth += (code[position] in "([{") - (code[position] in ")]}")
        if depth == 0:
            return position
    return -1


def split(code, begin, end, separator):
    """The ranges between the separators from `begin` to `end` that are inside no bracket."""
    ranges, depth, start = [], 0, begin
    for position in range(begin, end):
        depth += (code[position] in "([{") - (code[position] in ")]}")
        if depth == 0 and code[position] == separator:
            ranges.append((start, position))
            start = position + 1
    return ranges + [(start, end)]


def _conditions(source, code):
    for match in re.finditer(r"\b(if|while|for) \(", code):
        start = match.end() - 1
        parts = split(code, start + 1, closing(code, start), ";")
        if match.group(1) == "for":
            if len(parts) != 3:
                continue
            begin, end = parts[1]
        else:
            begin, end = parts[-1]
        declared = _DECLARATION.match(code, begin)
        if declared:
            yield Mutant(end, end, "; !" + declared.group(1), "negate")
        elif not _SINGLE.match(code[begin:end].strip()):
            yield Mutant(begin, end, " !(" + source[begin:end].strip() + ")", "negate")


def _choices(source, code):
    for match in re.finditer(r" \? ", code):
        rest = split(code, match.end(), len(code), ":")[0][1]
        while code[rest:rest + 2] == "::":  # of a name
            rest = split(code, rest + 2, len(code), ":")[0][1]
        depth, end = 0, rest + 1
        while end < len(code):
            depth += (code[end] in "([{") - (code[end] in ")]}")
            if depth < 0 or (depth == 0 and code[end] in ";,"):
                break
            end += 1
        first, second = source[match.end():rest].strip(), source[rest + 1:end].strip()
        yield Mutant(match.end(), end, second + " : " + first, "negate")


def _operators(source, code):
    for match in re.finditer(r"(?<= )(<=?|>=?|[!=]=)(?=\s)", code):
        kind = "negate" if match.group() in ("==", "!=") else "shift"
        yield Mutant(*match.span(), _COMPARISONS[match.group()], kind)
    for match in re.finditer(r"(?<= )(&&|\|\|)(?=\s)", code):
        yield Mutant(*match.span(), "||" if match.group() == "&&" else "&&", "negate")
    for match in re.finditer(r"(?<![\w)\]])!(?=[\w(])", code):
        yield Mutant(*match.span(), "", "negate")
    for match in re.finditer(r"\b(true|false)\b", code):
        yield Mutant(*match.span(), "false" if match.group() == "true" else "true", "negate")
    for match in re.finditer(r"\+\+|--", code):
        yield Mutant(*match.span(), "--" if match.group() == "++" else "++", "shift")
    for match in re.finditer(r"(?<= )[+-]=?(?= )", code):
        turned = match.group().translate(str.maketrans("+-", "-+"))
        yield Mutant(*match.span(), turned, "shift")
    for match in re.finditer(r"(?<![\w.])(0x[0-9A-Fa-f]+|\d+)(?=U?L?\b)", code):
        yield Mutant(*match.span(), str(int(match.group(), 0) + 1), "shift")


def _literals(source):
    for match in _LITERALS.finditer(source):
        text = match.group()
        if re.fullmatch(r"'[ -&(-Z\]-}]'", text):
            yield Mutant(*match.span(), "'" + chr(ord(text[1]) + 1) + "'", "shift")
        elif text[0] == '"' and 3 <= len(text) <= 14:
            for member in re.finditer(r"\\.|.", text[1:-1]):
                shorter = text[1:1 + member.start()] + text[1 + member.end():-1]
                yield Mutant(*match.span(), '"' + shorter + '"', "shorten")


def _targets(code):
    """Where an enumerator is returned, every other one that is returned somewhere."""
    returned = list(re.finditer(r"\breturn (\w+)::(\w+);", code))
    for match in returned:
        others = {other.group(2) for other in returned if other.group(1) == match.group(1)}
        for other in sorted(others - {match.group(2)}):
            yield Mutant(*match.span(2), other, "retarget")


def opening(code, end):
    """The position of the bracket that the one at `end` closes, or -1."""
    depth = 0
    for position in range(end, -1, -1):
        depth += (code[position] in ")]}") - (code[position] in "([{")
        if depth == 0:
            return position
    return -1


def _is_code(code, position):
    """Whether the innermost brackets around the position hold statements."""
    depth = 0
    for brace in range(position - 1, -1, -1):
        depth += (code[brace] in ")]}") - (code[brace] in "([{")
        if depth < 0:
            if code[brace] != "{":
                return False
            before = max(code.rfind(mark, 0, brace) for mark in ";{}")
            header = re.sub(r"template <[^{]*?> |<[^<>]*>", "", code[before + 1:brace])
            return not re.search(r"\b(?:class|struct|union|enum|namespace)\b|=\s*$", header)
    return False


def scope_end(code, position):
    """Where the block ends that holds the position."""
    depth = 0
    for brace in range(position, len(code)):
        depth += (code[brace] == "{") - (code[brace] == "}")
        if depth < 0:
            return brace
    return len(code)


def statement_starts(code):
    """The positions where a statement or a declaration may begin."""
    for match in re.finditer(r"(?<=[;{}):])\s+(?=[\w+\-*:(])|(?<=\belse)\s+(?=\w)", code):
        last = match.start() - 1
        line = code[code.rfind("\n", 0, last) + 1:last + 1]
        if code[last] == ")":
            condition = opening(code, last)
            if not re.search(r"\b(?:if|while|for) $", code[max(0, condition - 6):condition]):
                continue
        if code[last] == ":" and not re.match(r"\s*(?:case\b.*|default):$", line):
            continue
        if _is_code(code, match.end()):
            yield match.end()


def _statements(code):
    """The ranges of the statements that only have an effect, and of locks that are taken."""
    for begin in statement_starts(code):
        if _OTHER_STATEMENTS.match(code, begin):
            continue
        end = split(code, begin, len(code), ";")[0][1]
        text = code[begin:end]
        if "{" in text or "}" in text or re.search(r"\)\s+const\b|= (delete|default|0)$", text):
            continue
        declares = re.match(r"(?:const(?:expr)?\s+)?[\w:]+(?:<[^;=]*>)?[&*]*\s+(?:const\s+)?\w+\s*"
                            r"(?:=|\(|\{|$|VELKOR)", text)
        if declares and (re.search(r"[&*] \w+[,)]", text) or not _TAKEN.search(text)):
            continue
        if text.endswith(")") or re.search(r" [+-]?= |^(\+\+|--)", text):
            yield begin, end


def _dropped(source, code):
    statements = list(_statements(code))
    for begin, end in statements:
        operator = "lock" if _LOCKS.search(code, begin, end) else "drop"
        # A warning about what is left unused would hide what a test says.
        yield Mutant(begin, end, "static_cast<void>(0)" if operator == "drop" else "", operator)
    for (begin, end), (after, last) in zip(statements, statements[1:]):
        between = code[end + 1:after]
        if between.strip() or code.rfind("\n", 0, begin) == code.rfind("\n", 0, after):
            continue
        indent = begin - code.rfind("\n", 0, begin)
        if indent == after - code.rfind("\n", 0, after):
            gap = source[end:after]
            yield Mutant(begin, last, source[after:last] + gap + source[begin:end], "swap")


def _arguments(source, code):
    for match in re.finditer(r"\w\(", code):
        start = match.end() - 1
        ranges = split(code, start + 1, closing(code, start), ",")
        if len(ranges) != 2 or any("{" in code[begin:end] for begin, end in ranges):
            continue
        first, second = (source[begin:end].strip() for begin, end in ranges)
        parameter = re.compile(r"(const )?[\w:<>]+[&*]* \w+( =.*)?$")
        if first != second and not parameter.match(first):
            yield Mutant(ranges[0][0], ranges[1][1], second + ", " + first, "swap")


def mutants(source):
    """All mutants of the text of a source, from its beginning to its end."""
    code = masked(source)
    found = [*_conditions(source, code), *_choices(source, code), *_operators(source, code),
             *_literals(source), *_targets(code), *_dropped(source, code),
             *_arguments(source, code)]
    distinct = {(m.begin, m.end, m.text): m for m in found if source[m.begin:m.end] != m.text}
    return [distinct[key] for key in sorted(distinct)]
