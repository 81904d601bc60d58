"""Sources that hold all their mutants at once: which one is in force is said by the environment.

A condition or a statement that has mutants becomes a choice between them and itself, so that one
build serves for all. What can't be chosen while the program runs (declarations, constants, what is
computed at compile time) stays as it is."""

import re
from collections import namedtuple

from mutants import closing, masked, split, statement_starts

VARIABLE = "VELKOR_MUTANT"
HEADER = f"""#pragma once
#include <cstdlib>
inline const int velkorMutant = [] {{
    const char* const number = std::getenv("{VARIABLE}");
    return number == nullptr ? 0 : std::atoi(number);
}}();
"""

# What can be chosen, from `begin` to `end`: a statement with its semicolon (`type` is None), an
# expression of the type, or nothing yet, behind the condition that declares "; NAME".
Unit = namedtuple("Unit", "begin end type")

_KEYWORDS = re.compile(
    r"(?:using|if|for|while|case|default|break|continue|struct|class|enum|public|private|protected"
    r"|static|static_assert|typedef|friend|template|namespace|switch|else|do|try|catch|explicit"
    r"|virtual|extern|inline|operator|constexpr|const|auto|__extension__)\b")
_DECLARES = re.compile(r"(?!return\b|throw\b)[\w:]+(?:<[^;=]*>)?[&*]*\s+(?:const\s+)?[&*]?\w+\s*"
                       r"(?:=|\(|\{|;|$|VELKOR)")
_CONSTANT = re.compile(r"\bconst (bool|char|int|unsigned|std::(?:size_t|u?int\d+_t)) \w+ = ")


def _constant_regions(code):
    for match in re.finditer(r"\bconstexpr\b[^;{]*\)[^;{]*\{", code):
        yield match.start(), closing(code, match.end() - 1)


def _conditions(code):
    for match in re.finditer(r"\b(if|while|for) \(", code):
        parts = split(code, match.end(), closing(code, match.end() - 1), ";")
        if match.group(1) == "for" and len(parts) != 3:
            continue
        begin, end = parts[1] if match.group(1) == "for" else parts[-1]
        declared = re.match(r"\s*(?:const\s+)?auto\s*[&*]?\s*(\w+) =", code[begin:end])
        yield Unit(end, end, "; " + declared.group(1)) if declared else Unit(begin, end, "bool")


def _constants(code):
    for match in _CONSTANT.finditer(code):
        yield Unit(match.end(), split(code, match.end(), len(code), ";")[0][1], match.group(1))


def _statements(code):
    for begin in statement_starts(code):
        end = split(code, begin, len(code), ";")[0][1] + 1
        text = code[begin:end]
        if _KEYWORDS.match(text) or _DECLARES.match(text) or re.search(r"= (delete|default);", text):
            continue
        if re.match(r"[\w:~]+\([^;]*\)[^;(]*\{|[\w:<> ]*\([^{]*\)[^{(]*(:|VELKOR)[^{]*\{", text):
            continue  # a function
        yield Unit(begin, end, None)


def units(code):
    """All units of a masked source that can be switched."""
    constant = list(_constant_regions(code))
    found = [*_conditions(code), *_constants(code), *_statements(code)]
    return [unit for unit in found
            if not any(begin <= unit.begin < end for begin, end in constant)]


def _owner(mutant, all_units):
    holding = [u for u in all_units if u.begin <= mutant.begin and mutant.end <= u.end]
    return min(holding, key=lambda u: u.end - u.begin, default=None)


def switched(source, numbered):
    """The source with the mutants of `numbered`, a map from number to mutant: its text, the number
    that each of its lines belongs to (0 for none), and the numbers that it holds."""
    code = masked(source)
    every = units(code)
    owned = {}
    for number, mutant in numbered.items():
        owner = _owner(mutant, every)
        if owner is None and mutant.operator == "swap":  # of two statements, one of them declares
            continue
        if owner is not None:
            owned.setdefault(owner, []).append(number)
    # Two statements that change places are one unit around both.
    for number, mutant in numbered.items():
        if mutant.operator == "swap" and _owner(mutant, every) is None:
            inside = [u for u in every if u.type is None
                      and (u.begin == mutant.begin or u.end == mutant.end + 1)]
            if len(inside) == 2:
                owned.setdefault(Unit(mutant.begin, mutant.end + 1, None), []).append(number)

    def text_of(begin, end, among):
        """The text of a range in which the outermost of the units `among` are switched."""
        outer = []
        for unit in sorted(among, key=lambda u: (u.begin, -u.end)):
            if not outer or unit.begin >= outer[-1].end:
                outer.append(unit)
            elif unit.end > outer[-1].end:  # overlapping swaps: the first has it
                for number in owned.pop(unit):
                    dropped.add(number)
        text, position = "", begin
        for unit in outer:
            text += source[position:unit.begin] + choice(unit, [
                u for u in among if u != unit and unit.begin <= u.begin and u.end <= unit.end
                and u in owned])
            position = unit.end
        return text + source[position:end]

    def choice(unit, inner):
        def mutated(number):
            m = numbered[number]
            return source[unit.begin:m.begin] + m.text + source[m.end:unit.end]

        kept = text_of(unit.begin, unit.end, inner)
        numbers = owned[unit]
        if unit.begin == unit.end:  # what the condition declares
            cases = "".join(f"\n\x01{n}\x02velkorMutant == {n} ? !{unit.type[2:]} :\x03\n"
                            for n in numbers)
            return f"; ({cases} static_cast<bool>({unit.type[2:]}))"
        if unit.type is not None:
            cases = "".join(f"\n\x01{n}\x02velkorMutant == {n} ? static_cast<{unit.type}>("
                            f"{mutated(n).strip()}) :\x03\n" for n in numbers)
            return f"({cases} static_cast<{unit.type}>({kept.strip()}))"
        cases = "".join(f"\n\x01{n}\x02if (velkorMutant == {n}) {{ {mutated(n)} }} else\x03\n"
                        for n in numbers)
        return f"{{ {cases} {{ {kept} }} }}"

    dropped = set()
    text = text_of(0, len(source), list(owned))
    first_line = text.find("\n", text.find("#pragma once")) + 1 if "#pragma once" in text else 0
    text = text[:first_line] + '#include "velkorMutant.hpp"\n' + text[first_line:]
    held = {n for numbers in owned.values() for n in numbers} - dropped

    lines, current, out = [], 0, []
    for line in text.split("\n"):
        opened = re.search("\x01(\\d+)\x02", line)
        if opened:
            current = int(opened.group(1))
        lines.append(current)
        if "\x03" in line:
            current = 0
        out.append(re.sub("\x01\\d+\x02|\x03", "", line))
    return "\n".join(out), lines, held
