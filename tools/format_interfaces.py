#!/usr/bin/env python3
"""Runs clang-format on the C++ code of the SWIG interface files.

    python tools/format_interfaces.py [--check] [--clang-format PATH] [FILE.i ...]

clang-format cannot read an interface file (SWIG's directives are not C++), so
each block of C++ in it is formatted on its own:

- the code sections: %{ ... %} alone or after %begin, %runtime, %header,
  %wrapper, %init, %inline or %fragment(...); sections of Python code
  (%pythoncode, %pythonbegin, ...) are left alone;
- the code of %typemap and %exception: the body of { ... } or %{ ... %},
  formatted as the body of a function.

Code between %define and %enddef (macro parameters, ## pasting) is left as it
is written. A block is formatted as if it were a C++ file beside the interface
file, so the nearest .clang-format applies. A block whose formatted text would
differ in more than white space, or in one of SWIG's words ($1, %name), is
left as it is, with a warning.

Without FILE arguments, every interface file git knows is formatted. --check
writes nothing: it shows what would change and exits 1 if anything would.
"""

import argparse
import difflib
import re
import shutil
import subprocess
import sys
from concurrent.futures import ThreadPoolExecutor
from pathlib import Path

REPO = Path(__file__).resolve().parent.parent

CODE_SECTION = re.compile(r"^(\s*)(?:%(?:begin|runtime|header|wrapper|init|inline)\s*|%fragment\s*\(.*\)\s*)?%\{\s*$")
CODE_DIRECTIVE = re.compile(r"^(\s*)%(?:typemap|exception)\b")
SECTION_END = re.compile(r"^\s*%\}\s*$")
# The name of the function a directive's code is wrapped in while it is formatted.
WRAPPER = "swig_directive_code_"
# SWIG's own words in the code ($1, $symname, %argument_fail, $*1_ltype, ...),
# which formatting must leave whole.
SWIG_WORD = re.compile(r"%\w+|\$[*&]?\w+")
# clang-format reads $ as a letter, but would take % and the * or & of $*1 and
# $&1 for operators: they stand in as these words while it runs (not in
# strings and comments, which it does not change).
STAND_INS = {"%": "$PCT$", "$*": "$STAR$", "$&": "$AMP$"}
OUTSIDE_STRINGS = re.compile(
    r'"(?:\\.|[^"\\\n])*"|\'(?:\\.|[^\'\\\n])*\'|//[^\n]*|/\*.*?\*/|(%(?=[A-Za-z_])|\$[*&])', re.S
)


def blocks(lines):
    """(first, end, as_body) for each C++ block: lines[first:end] is its code."""
    i = 0
    while i < len(lines):
        line = lines[i]
        if re.match(r"^\s*%define\b", line):
            while i < len(lines) and not re.match(r"^\s*%enddef\b", lines[i]):
                i += 1
        elif CODE_SECTION.match(line):
            end = next((j for j in range(i + 1, len(lines)) if SECTION_END.match(lines[j])), None)
            if end is None:
                return
            yield i + 1, end, False
            i = end
        elif CODE_DIRECTIVE.match(line):
            indent = CODE_DIRECTIVE.match(line).group(1)
            # The directive's head goes on over lines that end in a comma; its
            # code starts after the line that ends in { or %{.
            head = i
            while lines[head].rstrip().endswith(",") and head + 1 < len(lines):
                head += 1
            opening = lines[head].rstrip()
            end = None
            if opening.endswith("%{"):
                end = next((j for j in range(head + 1, len(lines)) if SECTION_END.match(lines[j])), None)
            elif opening.endswith("{"):
                closing = re.compile(r"^%s\}\s*$" % re.escape(indent))
                end = next((j for j in range(head + 1, len(lines)) if closing.match(lines[j])), None)
            if end is not None:
                yield head + 1, end, True
                i = end
        elif re.match(r"^\s*%\w+.*%\{", line):
            # A section of another language: skipped to its end.
            while i < len(lines) and "%}" not in lines[i]:
                i += 1
        i += 1


def common_indent(lines):
    widths = [len(line) - len(line.lstrip()) for line in lines if line.strip()]
    return min(widths) if widths else 0


def same_code(lines):
    """The text without white space and the comments clang-format adds to the
    ends of namespaces: what formatting must not change."""
    return re.sub(r"\s+", "", re.sub(r"//\s*namespace\b.*", "", "".join(lines)))


def swig_words(lines):
    return SWIG_WORD.findall("".join(lines))


def format_block(clang_format, path, code, as_body):
    """The block's lines formatted, or None when they cannot be."""
    if not any(line.strip() for line in code):
        return code
    cut = common_indent(code)
    text = "".join(line[cut:] if line.strip() else "\n" for line in code)
    if any(stand_in in text for stand_in in STAND_INS.values()):
        return None
    text = OUTSIDE_STRINGS.sub(lambda m: STAND_INS[m.group(1)] if m.group(1) else m.group(0), text)
    if as_body:
        # The comment keeps a short body from being joined to the braces.
        text = "void %s() {\n// %s\n%s}\n" % (WRAPPER, WRAPPER, text)
    result = subprocess.run(
        [clang_format, "--style=file", "--assume-filename=%s.cpp" % path],
        input=text,
        capture_output=True,
        text=True,
        check=False,
    )
    if result.returncode != 0:
        return None
    out = result.stdout
    for word, stand_in in STAND_INS.items():
        out = out.replace(stand_in, word)
    out = out.splitlines(keepends=True)
    if as_body:
        start = next((k + 1 for k, line in enumerate(out) if line.strip() == "// " + WRAPPER), None)
        if start is None or out[-1].strip() != "}":
            return None
        inner = common_indent(out[start:-1])
        out = [line[inner:] for line in out[start:-1]]
    # The block keeps the indentation it was written at.
    formatted = [" " * cut + line if line.strip() else "\n" for line in out]
    if same_code(formatted) != same_code(code) or swig_words(formatted) != swig_words(code):
        return None
    return formatted


def format_file(clang_format, path):
    """The file's text with its blocks formatted, and warnings."""
    lines = path.read_text().splitlines(keepends=True)
    found = list(blocks(lines))
    with ThreadPoolExecutor(max_workers=2) as pool:
        results = list(pool.map(lambda b: format_block(clang_format, path, lines[b[0] : b[1]], b[2]), found))
    warnings = []
    for (first, end, _), formatted in reversed(list(zip(found, results))):
        if formatted is None:
            warnings.append(
                "%s:%d: block left as it is (clang-format would change more than white space)" % (path, first + 1)
            )
        else:
            lines[first:end] = formatted
    return "".join(lines), warnings


def default_clang_format():
    """The binary of the clang-format package when this interpreter has it
    (its launcher script would start an interpreter for every block), else
    clang-format on the PATH."""
    try:
        import clang_format
    except ImportError:
        return shutil.which("clang-format")
    return clang_format.get_executable("clang-format")


def main(argv=None):
    parser = argparse.ArgumentParser(description=__doc__.split("\n\n")[0])
    parser.add_argument("files", nargs="*", type=Path, help="interface files (all that git knows if none)")
    parser.add_argument("--check", action="store_true", help="show what would change; write nothing")
    parser.add_argument("--clang-format", default=default_clang_format(), help="clang-format executable")
    args = parser.parse_args(argv)
    if not args.clang_format:
        parser.error("no clang-format found: give --clang-format")
    files = args.files or [
        REPO / name
        for name in subprocess.run(
            ["git", "ls-files", "*.i"], cwd=REPO, capture_output=True, text=True, check=True
        ).stdout.split()
    ]
    changed = 0
    for path in files:
        old = path.read_text()
        new, warnings = format_file(args.clang_format, path)
        for warning in warnings:
            print("warning: %s" % warning, file=sys.stderr)
        if new == old:
            continue
        changed += 1
        if args.check:
            sys.stdout.writelines(
                difflib.unified_diff(old.splitlines(keepends=True), new.splitlines(keepends=True), str(path), str(path))
            )
        else:
            path.write_text(new)
            print("formatted %s" % path)
    if args.check and changed:
        print("%d interface file(s) not formatted: run tools/format.sh" % changed, file=sys.stderr)
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main())
