#!/usr/bin/env python3
"""Writes the man page and the bash completion of lsc from the program's own
help text, so neither can fall behind the options the program accepts.

  help_docs.py manpage TEMPLATE README OUT -- PROGRAM...
  help_docs.py completion OUT -- PROGRAM...

PROGRAM is the command that starts the built lsc (in a cross build, the
emulator first). The man page fills the template's @...@ fields: the version
and usage line and the options from `--help --kq`, the configuration keys and
exit statuses from the README's tables, which stay their one source.
"""

import re
import subprocess
import sys
from dataclasses import dataclass, field

# "  -i [ --input ] arg   text", "  --log arg (=-)   text", "  --kq   text"
OPTION = re.compile(
    r"^  (?:-(?P<short>\w) \[ --(?P<long>[\w-]+) \]|--(?P<only>[\w-]+))"
    r"(?P<arg> arg(?: \(=(?P<default>[^)]*)\))?)?(?: +(?P<text>\S.*))?$")
CAPTION = re.compile(r"^(\S.*):$")


@dataclass
class Option:
    long: str
    short: str
    takes_file: bool
    default: str
    text: str = ""


@dataclass
class Group:
    caption: str
    options: list = field(default_factory=list)


@dataclass
class Help:
    version_line: str
    usage: str
    groups: list


def run_help(program):
    result = subprocess.run(program + ["--help", "--kq"], capture_output=True, text=True,
                            check=True)
    return result.stdout


def parse_help(text):
    lines = text.splitlines()
    if len(lines) < 3 or not lines[1].startswith("Usage: "):
        sys.exit("help_docs.py: the help text does not start with the version and usage lines")
    groups = []
    last = None
    for line in lines[2:]:
        caption = CAPTION.match(line)
        if caption:
            groups.append(Group(caption.group(1)))
            last = None
            continue
        match = OPTION.match(line)
        if match:
            last = Option(long=match.group("long") or match.group("only"),
                          short=match.group("short") or "",
                          takes_file=match.group("arg") is not None,
                          default=match.group("default") or "",
                          text=(match.group("text") or "").rstrip())
            groups[-1].options.append(last)
        elif line.strip() and last is not None:
            last.text = (last.text + " " + line.strip()).strip()
        elif line.strip():
            sys.exit("help_docs.py: cannot read this help line: " + line)
    groups = [group for group in groups if group.options]  # the outer caption holds none
    if not groups:
        sys.exit("help_docs.py: no options found in the help text")
    return Help(lines[0], lines[1][len("Usage: "):], groups)


# --- roff ------------------------------------------------------------------

def roff_escape(text, code=False):
    out = []
    for ch in text:
        if ch == "\\":
            out.append("\\e")
        elif ch == "-" and code:
            out.append("\\-")  # a minus, so that copied options work
        elif ord(ch) > 127:
            out.append("\\[u%04X]" % ord(ch))
        else:
            out.append(ch)
    return "".join(out)


def inline(markdown):
    """The README's inline markdown as roff: code and bold in bold, links as
    their text, backslash escapes resolved."""
    parts = markdown.split("`")
    out = []
    for index, part in enumerate(parts):
        if index % 2:
            out.append("\\fB" + roff_escape(part, code=True) + "\\fR")
            continue
        part = re.sub(r"\[([^\]]*)\]\([^)]*\)", r"\1", part)
        part = re.sub(r"\\([\\`*_{}\[\]()#+.!|-])", r"\1", part)
        pieces = part.split("**")
        for bold, piece in enumerate(pieces):
            text = roff_escape(piece)
            out.append("\\fB" + text + "\\fR" if bold % 2 else text)
    return "".join(out)


def line_safe(text):
    # A line starting with a dot or a quote would be read as a request.
    return "\\&" + text if text[:1] in (".", "'") else text


def readme_table(readme, heading, columns):
    """The rows (lists of `columns` cells) of the first table under `heading`."""
    lines = readme.splitlines()
    try:
        start = lines.index(heading)
    except ValueError:
        sys.exit("help_docs.py: README has no section '%s'" % heading)
    rows = []
    for line in lines[start + 1:]:
        if line.startswith("#"):
            break
        if line.startswith("|"):
            rows.append(line)
        elif rows:
            break
    cells = [[cell.strip() for cell in re.split(r"(?<!\\)\|", row)[1:-1]] for row in rows]
    body = cells[2:]  # after the header and the rule
    if not body:
        sys.exit("help_docs.py: README section '%s' has no table" % heading)
    for row in body:
        if len(row) != columns:
            sys.exit("help_docs.py: README section '%s': a row of %d cells, not %d: %s"
                     % (heading, len(row), columns, " | ".join(row)))
    return body


def option_tag(option):
    tag = "\\fB\\-\\-" + roff_escape(option.long, code=True) + "\\fR"
    if option.short:
        tag = "\\fB\\-" + option.short + "\\fR, " + tag
    if option.takes_file:
        tag += " \\fIFILE\\fR"
    return tag


def options_roff(help_text):
    out = []
    for group in help_text.groups:
        out.append(".SS " + roff_escape(group.caption))
        for option in group.options:
            text = roff_escape(option.text)
            if option.default:
                text += " (default: \\fB" + roff_escape(option.default, code=True) + "\\fR)"
            out += [".TP", option_tag(option), line_safe(text)]
    return "\n".join(out)


def sentence(roff_text):
    """Capitalised: a table cell starts lower case, a man page entry does not."""
    match = re.match(r"((?:\\f[BIR])*)([a-z])", roff_text)
    if not match:
        return roff_text
    return match.group(1) + match.group(2).upper() + roff_text[match.end():]


def keys_roff(readme):
    out = []
    for key, default, allowed, meaning in readme_table(readme, "## Configuration", 4):
        details = "default " + (inline(default) if default else "empty")
        if allowed:
            details += "; " + inline(allowed)
        out += [".TP", inline(key), line_safe(sentence(inline(meaning)) + " (" + details + ").")]
    return "\n".join(out)


def exit_status_roff(readme):
    out = []
    for status, meaning in readme_table(readme, "## Exit status", 2):
        out += [".TP", "\\fB" + roff_escape(status) + "\\fR", line_safe(sentence(inline(meaning)))]
    return "\n".join(out)


def usage_roff(usage):
    words = []
    for word in usage.split():
        if word.startswith("-"):
            words.append("\\fB" + roff_escape(word, code=True) + "\\fR")
        elif word.isupper():
            words.append("\\fI" + word + "\\fR")
        elif word.startswith("[") and word.endswith("]"):
            words.append("[\\fI" + word[1:-1] + "\\fR]")
        else:
            words.append("\\fB" + word + "\\fR")
    return " ".join(words)


def write_manpage(template_path, readme_path, out_path, program):
    help_text = parse_help(run_help(program))
    with open(readme_path, encoding="utf-8") as f:
        readme = f.read()
    with open(template_path, encoding="utf-8") as f:
        page = f.read()
    fields = {
        "@VERSION@": help_text.version_line.split()[-1],
        "@USAGE@": usage_roff(help_text.usage),
        "@OPTIONS@": options_roff(help_text),
        "@CONFIGURATION_KEYS@": keys_roff(readme),
        "@EXIT_STATUS@": exit_status_roff(readme),
    }
    for name, value in fields.items():
        if name not in page:
            sys.exit("help_docs.py: the template has no field " + name)
        page = page.replace(name, value)
    with open(out_path, "w", encoding="utf-8") as f:
        f.write(page)


# --- bash completion ---------------------------------------------------------

COMPLETION = """\
# bash completion for lsc, made from `lsc --help --kq` when lsc was built.
# The advanced options are offered once --kq is on the command line.
_lsc() {
    local cur=${COMP_WORDS[COMP_CWORD]} prev=${COMP_WORDS[COMP_CWORD-1]}
    case $prev in
        %(file_options)s)
            if declare -F _filedir >/dev/null; then
                _filedir
            else
                compopt -o filenames 2>/dev/null
                mapfile -t COMPREPLY < <(compgen -f -- "$cur")
            fi
            return
            ;;
    esac
    local options="%(basic)s" word
    for word in "${COMP_WORDS[@]}"; do
        if [ "$word" = --kq ]; then
            options="$options %(advanced)s"
            break
        fi
    done
    mapfile -t COMPREPLY < <(compgen -W "$options" -- "$cur")
}
complete -F _lsc lsc
"""


def write_completion(out_path, program):
    help_text = parse_help(run_help(program))
    basic, advanced, file_options = [], [], []
    for index, group in enumerate(help_text.groups):
        for option in group.options:
            # --kq itself is offered from the start: it opens the advanced group.
            (basic if index == 0 or option.long == "kq" else advanced).append("--" + option.long)
            if option.takes_file:
                file_options.append("--" + option.long)
                if option.short:
                    file_options.append("-" + option.short)
    with open(out_path, "w", encoding="utf-8") as f:
        f.write(COMPLETION % {"file_options": "|".join(file_options),
                              "basic": " ".join(basic), "advanced": " ".join(advanced)})


def main(argv):
    if "--" not in argv:
        sys.exit(__doc__)
    split = argv.index("--")
    args, program = argv[1:split], argv[split + 1:]
    if args[:1] == ["manpage"] and len(args) == 4 and program:
        write_manpage(args[1], args[2], args[3], program)
    elif args[:1] == ["completion"] and len(args) == 2 and program:
        write_completion(args[1], program)
    else:
        sys.exit(__doc__)


if __name__ == "__main__":
    main(sys.argv)
