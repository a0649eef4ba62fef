"""The mutants of the library's sources: how they are found, stored and applied.

A mutant is one small edit of one line of a source under src/ or hosts/.  It is kept
in mutants.tsv without line or column numbers, so that edits elsewhere in a
file leave it valid: it names the file, the line's text (stripped of its
indentation), which occurrence of that text in the file it is (usually 1),
and a fragment of the line with its replacement, the fragment being long
enough to occur exactly once in the line.  A mutant whose line or fragment
can no longer be found is stale.
"""

import re
from dataclasses import dataclass
from pathlib import Path

# The folders of the library whose code is mutated, and those of the hosts,
# in the order of the report.  A set drawn without naming folders is drawn
# from the library's.
LIBRARY_FOLDERS = ("src/calendar", "src/datetime", "src/numeric", "src/string", "src/engine",
                   "src/frame")
HOST_FOLDERS = ("hosts/common", "hosts/sqlite", "hosts/postgres")
FOLDERS = LIBRARY_FOLDERS + HOST_FOLDERS

KINDS = ("relational", "constant", "arithmetic", "logical", "negate", "branch", "bound")

TSV_COLUMNS = ("id", "kind", "file", "occurrence", "line", "original", "mutated")


@dataclass(frozen=True)
class Mutant:
    """One edit: `original` becomes `mutated` in the given line of `file`."""

    id: str
    kind: str
    file: str  # relative to the repository's root
    occurrence: int  # which line of the file with this stripped text, from 1
    line: str  # the line's text, stripped
    original: str  # a fragment that occurs once in `line`
    mutated: str  # what the fragment becomes

    @property
    def folder(self):
        """The library folder that holds the mutated file, such as src/string."""
        return str(Path(self.file).parent)

    def mutated_line(self):
        """The stripped line as the mutant makes it."""
        return self.line.replace(self.original, self.mutated, 1)

    def row(self):
        """The mutant as a row of mutants.tsv."""
        return "\t".join([self.id, self.kind, self.file, str(self.occurrence), self.line,
                          self.original, self.mutated])


# --------------------------------------------------------------------------
# Reading and writing the list


def load(path):
    """The mutants of a mutants.tsv file, in its order."""
    result = []
    for number, raw in enumerate(Path(path).read_text(encoding="utf-8").splitlines(), 1):
        if not raw or raw.startswith("#"):
            continue
        fields = raw.split("\t")
        if fields[0] == "id":
            continue
        if len(fields) != len(TSV_COLUMNS):
            raise ValueError(f"{path}:{number}: expected {len(TSV_COLUMNS)} fields")
        ident, kind, file, occurrence, line, original, mutated = fields
        result.append(Mutant(ident, kind, file, int(occurrence), line, original, mutated))
    return result


def save(path, mutants, header_lines):
    """Writes `mutants` to `path`, after `header_lines` as comments."""
    out = [f"# {text}" if text else "#" for text in header_lines]
    out.append("\t".join(TSV_COLUMNS))
    out.extend(m.row() for m in mutants)
    Path(path).write_text("\n".join(out) + "\n", encoding="utf-8")


# --------------------------------------------------------------------------
# Finding a mutant in a file and applying it


def count_overlapping(text, fragment):
    """How many times `fragment` occurs in `text`, overlaps included."""
    count, start = 0, text.find(fragment)
    while start != -1:
        count += 1
        start = text.find(fragment, start + 1)
    return count


def locate(text, mutant):
    """The index of the mutant's line among text.split('\\n'), or None if stale.

    The line is the mutant's occurrence-th one whose stripped text is the
    mutant's line, and the fragment must occur in it exactly once.
    """
    seen = 0
    for index, line in enumerate(text.split("\n")):
        if line.strip() == mutant.line:
            seen += 1
            if seen == mutant.occurrence:
                return index if count_overlapping(line, mutant.original) == 1 else None
    return None


def apply(text, mutant):
    """The file's text with the mutant applied, and the 1-based line number; None if stale."""
    index = locate(text, mutant)
    if index is None:
        return None
    lines = text.split("\n")
    lines[index] = lines[index].replace(mutant.original, mutant.mutated, 1)
    return "\n".join(lines), index + 1


def windows_only_lines(text):
    """The 1-based numbers of the lines that only a Windows build compiles.

    They are the lines inside `#if defined(_WIN32)` or `#ifdef _WIN32`
    (before its `#else` or `#elif`), and after the `#else` of `#if
    !defined(_WIN32)` or `#ifndef _WIN32`.  A condition that names _WIN32
    among others is not followed: the lines under it count as compiled on
    both.
    """
    windows = re.compile(r"#\s*(ifdef\s+_WIN32|if\s+defined\s*\(?\s*_WIN32\s*\)?)\s*(//.*)?$")
    not_windows = re.compile(r"#\s*(ifndef\s+_WIN32|if\s+!\s*defined\s*\(?\s*_WIN32\s*\)?)\s*(//.*)?$")
    stack = []  # per open #if: "win", "linux" (compiled only off Windows) or "any"
    lines = set()
    for number, line in enumerate(text.split("\n"), 1):
        code = line.strip()
        if code.startswith("#"):
            if windows.match(code):
                stack.append("win")
            elif not_windows.match(code):
                stack.append("linux")
            elif re.match(r"#\s*if", code):
                stack.append("any")
            elif re.match(r"#\s*else", code) and stack:
                stack[-1] = {"win": "linux", "linux": "win"}.get(stack[-1], "any")
            elif re.match(r"#\s*elif", code) and stack:
                stack[-1] = "linux" if stack[-1] == "win" else "any"
            elif re.match(r"#\s*endif", code) and stack:
                stack.pop()
            continue
        if "win" in stack:
            lines.add(number)
    return lines


# --------------------------------------------------------------------------
# Reading C++ sources: which characters are code


def mask_code(text):
    """`text` with everything that is not code replaced, keeping every column.

    Comments and preprocessor lines become blanks; string and character
    literals become '$' (delimiters included), so that no operator or number
    is found inside them.  Newlines stay where they are.
    """
    out = list(text)
    i, n = 0, len(text)
    line_start = True  # only blanks so far on this line

    def blank(start, end, fill):
        """Replaces text[start:end] by `fill`, newlines excepted."""
        for k in range(start, end):
            if out[k] != "\n":
                out[k] = fill

    while i < n:
        c = text[i]
        if c == "\n":
            line_start = True
            i += 1
            continue
        if line_start and c == "#":
            # A directive, with its continuation lines.
            end = i
            while end < n:
                if text[end] == "\n" and text[end - 1] != "\\":
                    break
                end += 1
            blank(i, end, " ")
            i = end
            continue
        if not c.isspace():
            line_start = False
        if text.startswith("//", i):
            end = text.find("\n", i)
            end = n if end == -1 else end
            blank(i, end, " ")
            i = end
        elif text.startswith("/*", i):
            end = text.find("*/", i + 2)
            end = n if end == -1 else end + 2
            blank(i, end, " ")
            i = end
        elif c == "R" and text.startswith('R"', i) and not _in_word(text, i):
            match = re.match(r'R"([^()\\ ]{0,16})\(', text[i:])
            if match:
                close = ")" + match.group(1) + '"'
                end = text.find(close, i + match.end())
                end = n if end == -1 else end + len(close)
                blank(i, end, "$")
                i = end
            else:
                i += 1
        elif c == '"':
            end = _end_of_quoted(text, i, '"')
            blank(i, end, "$")
            i = end
        elif c == "'":
            if _is_digit_separator(text, i):
                i += 1
                continue
            end = _end_of_quoted(text, i, "'")
            blank(i, end, "$")
            i = end
        else:
            i += 1
    return "".join(out)


def _in_word(text, i):
    """Whether position i continues an identifier or number."""
    return i > 0 and (text[i - 1].isalnum() or text[i - 1] == "_")


def _is_digit_separator(text, i):
    """Whether the quote at i separates digits, as in 1'000, rather than opening a literal."""
    k = i
    while k > 0 and (text[k - 1].isalnum() or text[k - 1] in "_'"):
        k -= 1
    return k < i and text[k].isdigit()


def _end_of_quoted(text, i, quote):
    """The position just after the literal opened by the quote at i."""
    k = i + 1
    while k < len(text) and text[k] != quote and text[k] != "\n":
        k += 2 if text[k] == "\\" else 1
    return min(k + 1, len(text))


# --------------------------------------------------------------------------
# Candidate sites


@dataclass(frozen=True)
class Site:
    """A place where a mutant could be made, before one is chosen.

    `change` is the new text of the site's token: a string, or where there
    is a choice a tuple that make_mutation decides, ("int", digits, suffix)
    for a constant and ("if", condition) for a branch.  `prefix` and
    `suffix` widen the token into a fragment that occurs once in the line.
    """

    kind: str
    file: str
    line_number: int  # 1-based, only to order and to describe
    column: int  # of the token in the stripped line
    occurrence: int
    line: str
    prefix: str
    token: str
    suffix: str
    change: object


RELATIONAL = {"<": "<=", "<=": "<", ">": ">=", ">=": ">", "==": "!=", "!=": "=="}
ARITHMETIC = {"+": "-", "-": "+", "*": "/", "/": "*", "%": "/", "+=": "-=", "-=": "+=",
              "*=": "/=", "/=": "*=", "<<": ">>", ">>": "<<", "&": "|", "|": "&"}
LOGICAL = {"&&": "||", "||": "&&"}

# A binary operator written between blanks, as the sources' format has it;
# a template's brackets, a pointer's star and a reference's ampersand are
# never so written.
_SPACED_OPERATOR = re.compile(r"(?<= )(<<|>>|<=|>=|==|!=|&&|\|\||\+=|-=|\*=|/=|[<>+\-*/%&|])(?= )")
_INCREMENT = re.compile(r"\+\+|--")
_INTEGER = re.compile(r"(?<![\w.$'])(0[xX][0-9a-fA-F]+|\d+)([uUlL]*)(?![\w.'])")
_DECLARED_SIZE = re.compile(
    r"([A-Za-z_][\w:]*[>*&]?)\s+[*&]*([A-Za-z_]\w*)(\s*\[[^\]]*\])*\s*\[\s*$")
_NOT_TYPES = {"return", "case", "else", "do", "throw", "delete", "new", "co_return", "sizeof"}

# Lines that are not run-time code, by how their code begins.
_SKIPPED_STARTS = ("template", "static_assert", "using ", "namespace", "typedef", "friend",
                   "extern", "#", "assert(", "[[deprecated")


def _matching_paren(masked, open_index):
    """The index of the parenthesis closing the one at open_index, or -1 if not on this line."""
    depth = 0
    for k in range(open_index, len(masked)):
        if masked[k] == "(":
            depth += 1
        elif masked[k] == ")":
            depth -= 1
            if depth == 0:
                return k
    return -1


def _has_assignment(code):
    """Whether an expression holds '=' that is not part of a comparison."""
    return re.search(r"(?<![=!<>+\-*/%&|^])=(?!=)", code) is not None


def _is_condition(code):
    """Whether an expression is a comparison or a logical combination at its top level."""
    depth = 0
    flat = []
    for c in code:
        if c in "([{":
            depth += 1
        elif c in ")]}":
            depth -= 1
        flat.append(c if depth == 0 else " ")
    top = "".join(flat)
    compares = re.search(r" (<=|>=|==|!=|<|>|&&|\|\|) ", top) is not None
    return compares or code.lstrip().startswith("!")


def find_sites(file, text):
    """Every candidate site of every kind in one source's text."""
    masked_lines = mask_code(text).split("\n")
    lines = text.split("\n")
    occurrences = {}
    sites = []
    in_static_assert = False
    for index, (line, masked) in enumerate(zip(lines, masked_lines)):
        stripped = line.strip()
        occurrences[stripped] = occurrences.get(stripped, 0) + 1
        code = masked.strip()
        if in_static_assert:
            in_static_assert = not code.endswith(";")
            continue
        if not code or "\t" in line:
            continue
        if code.startswith("static_assert") and not code.endswith(";"):
            in_static_assert = True
            continue
        if code.startswith(_SKIPPED_STARTS) or "if constexpr" in code or "static_assert" in code:
            continue
        lead = len(line) - len(line.lstrip())
        found = []  # (kind, start, end, change), columns in the full line
        found += _operator_sites(masked, line)
        found += _constant_sites(masked)
        found += _branch_sites(masked, line)
        found += _return_sites(masked, line)
        fixed = _template_arguments(masked) + _declared_sizes(masked)
        for kind, start, end, change in found:
            if any(a <= start < b for a, b in fixed):
                continue
            widened = _unique_fragment(stripped, start - lead, end - lead)
            if widened is None:
                continue
            a, b = widened
            sites.append(Site(kind, file, index + 1, start - lead, occurrences[stripped], stripped,
                              stripped[a:start - lead], stripped[start - lead:end - lead],
                              stripped[end - lead:b], change))
    return sites


def _template_arguments(masked):
    """The spans of a line's template argument lists, such as `2 * (n + m)` in `get<2 * (n + m)>`.

    Their values are fixed at compile time, where changing them mostly
    changes types, and so fails to compile.
    """
    spans = []
    for match in re.finditer(r"\w<(?![<=])", masked):
        depth = 0
        for k in range(match.end() - 1, len(masked)):
            c = masked[k]
            if c in "<(":
                depth += 1
            elif c in ">)":
                depth -= 1
                if depth == 0:
                    if c == ">":
                        spans.append((match.end(), k))
                    break
            elif c in ";{":
                break
    return spans


def _declared_sizes(masked):
    """The spans of the sizes of arrays being declared, such as `31 * 12` in `int t[31 * 12]`."""
    spans = []
    for match in re.finditer(r"\[", masked):
        declared = _DECLARED_SIZE.search(masked[:match.end()])
        if not declared or declared.group(1) in _NOT_TYPES:
            continue
        close = masked.find("]", match.end())
        if close != -1:
            spans.append((match.end(), close))
    return spans


def _operator_sites(masked, line):
    """Relational, arithmetic and logical operators, and increments outside a for's header."""
    found = []
    chains = set()
    for match in _SPACED_OPERATOR.finditer(masked):
        op = match.group(1)
        if op in RELATIONAL:
            found.append(("relational", match.start(), match.end(), RELATIONAL[op]))
        elif op in LOGICAL:
            chain = _logical_group(masked, match.start())
            if chain is not None and chain not in chains:
                chains.add(chain)
                start, end = chain[0], chain[-1] + 2
                turned = list(line[start:end])
                for position in chain:
                    turned[position - start:position - start + 2] = LOGICAL[op]
                found.append(("logical", start, end, "".join(turned)))
        else:
            found.append(("arithmetic", match.start(), match.end(), ARITHMETIC[op]))
    # A loop's own step turned around only runs off its range, so it is left
    # out; so is every increment of a line that opens a loop it cannot see whole.
    header = None
    loop = re.search(r"\bfor \(", masked)
    if loop:
        close = _matching_paren(masked, loop.end() - 1)
        if close == -1:
            return found
        header = (loop.start(), close)
    for match in _INCREMENT.finditer(masked):
        if header and header[0] < match.start() < header[1]:
            continue
        replacement = "--" if match.group() == "++" else "++"
        found.append(("arithmetic", match.start(), match.end(), replacement))
    return found


def _bracket_edge(masked, at, step):
    """Where the parentheses around `at` open (step -1) or close (step 1) on this line.

    Returns the position just inside that bracket, and whether there is one.
    """
    deeper, edge = ("([", ")]") if step > 0 else (")]", "([")
    depth, i = 0, at
    while (i < len(masked)) if step > 0 else (i > 0):
        c = masked[i] if step > 0 else masked[i - 1]
        if c in deeper:
            depth += 1
        elif c in edge:
            if depth == 0:
                return i, True
            depth -= 1
        i += step
    return i, False


def _logical_group(masked, at):
    """The positions of the `&&` or `||` operators of the chain that holds the one at `at`.

    A chain is the logical operators at one level of parentheses.  Turning
    one link of `a && b && c` alone would mix `&&` and `||` without
    parentheses, which the build refuses as a warning, so the whole chain
    is turned.  None for a chain that goes on over another line, or one
    that mixes both operators (they stand only parenthesised here).
    """
    start, opened = _bracket_edge(masked, at, -1)
    end, closed = _bracket_edge(masked, at, 1)
    if opened != closed or (not opened and not masked.rstrip().endswith((";", "{"))):
        return None  # the chain goes on over another line
    links, depth = [], 0
    for match in re.finditer(r"[()\[\]]|(?<= )(&&|\|\|)(?= )", masked[start:end]):
        token = match.group()
        if token in "([":
            depth += 1
        elif token in ")]":
            depth -= 1
        elif depth == 0:
            links.append((start + match.start(), token))
    if len({token for _, token in links}) != 1:
        return None
    return tuple(position for position, _ in links)


def _constant_sites(masked):
    """Integer literals, except those of template arguments and alignments."""
    found = []
    for match in _INTEGER.finditer(masked):
        before = masked[:match.start()]
        after = masked[match.end():]
        if before.endswith("<") or after.startswith(">") or before.endswith("alignas("):
            continue
        found.append(("constant", match.start(), match.end(),
                      ("int", match.group(1), match.group(2))))
    return found


def _branch_sites(masked, line):
    """`if (...)` conditions held on one line: each can be made never or always true.

    A condition that compares and guards a return, break or continue is a
    bound check, which is only ever dropped.
    """
    found = []
    for match in re.finditer(r"\bif \(", masked):
        close = _matching_paren(masked, match.end() - 1)
        if close == -1:
            continue
        condition = line[match.end():close]
        if condition != masked[match.end():close]:
            continue  # holds a literal or a comment
        if ";" in condition or _has_assignment(condition):
            continue
        rest = masked[close + 1:].strip()
        guards = re.search(r" (<=|>=|<|>) ", condition) and re.match(
            r"(\{ )?(return|break|continue)\b", rest)
        kind = "bound" if guards else "branch"
        found.append((kind, match.start(), close + 1, ("if", condition)))
    return found


def _return_sites(masked, line):
    """`return <condition>;` held on one line: the condition can be negated."""
    found = []
    for match in re.finditer(r"\breturn (?=[^;]*;)", masked):
        end = masked.find(";", match.end())
        expression = masked[match.end():end]
        if "?" in expression or "$" in expression or "{" in expression:
            continue
        if expression.count("(") != expression.count(")") or not _is_condition(expression):
            continue
        text = line[match.end():end]
        found.append(("negate", match.start(), end + 1, f"return !({text});"))
    return found


def _unique_fragment(stripped, start, end):
    """The bounds of the shortest fragment around [start, end) that occurs once in the line.

    The fragment grows by whole words on each side, so that it reads as a
    piece of the expression, such as `y < 1` rather than `< 1`.
    """
    if start < 0 or end > len(stripped) or start >= end:
        return None
    a, b = start, end
    while count_overlapping(stripped, stripped[a:b]) > 1:
        if a == 0 and b == len(stripped):
            return None
        while a > 0 and stripped[a - 1] == " ":
            a -= 1
        while a > 0 and stripped[a - 1] != " ":
            a -= 1
        while b < len(stripped) and stripped[b] == " ":
            b += 1
        while b < len(stripped) and stripped[b] != " ":
            b += 1
    return a, b


def make_mutation(site, rng):
    """The (original, mutated) fragments of a site, deciding with `rng` where there is a choice.

    A constant goes one up or one down (zero only up).  A branch's condition
    becomes `false && (...)`, so that the branch is never taken, or `true ||
    (...)`, so that it always is; a bound check is only ever dropped.  The
    condition stays in the text, so that nothing it names becomes unused.
    """
    original = site.prefix + site.token + site.suffix
    change = site.change
    if isinstance(change, str):
        return original, site.prefix + change + site.suffix
    if change[0] == "if":
        condition = change[1].strip()
        if site.kind == "bound" or rng.random() < 0.5:
            new = f"if (false && ({condition}))"
        else:
            new = f"if (true || ({condition}))"
        return original, site.prefix + new + site.suffix
    _, digits, letters = change
    up = rng.random() < 0.5
    if digits.lower().startswith("0x"):
        value = int(digits, 16)
        value += 1 if value == 0 or up else -1
        body = format(value, "X" if any(c.isupper() for c in digits[2:]) else "x")
        new = digits[:2] + body.rjust(len(digits) - 2, "0")
    else:
        value = int(digits)
        value += 1 if value == 0 or up else -1
        new = str(value)
    return original, site.prefix + new + letters + site.suffix
