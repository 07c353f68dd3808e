#!/usr/bin/env python3
"""Checks the report page the tool wrote, with a real HTML parser.

Usage: check_report.py FILE --figures N --verdict pass|fail|incomplete|xtest

CI runs it on the example's page before rendering it: UTF-8 with a doctype,
elements closed in order, nothing that runs or loads from outside the page,
the figure count and the verdict. Prints every problem and exits 1, or exits 0.
"""

import argparse
import re
import sys
from html.parser import HTMLParser

VOID = {"br", "col", "hr", "meta", "wbr"}
FORBIDDEN = {"script", "iframe", "object", "embed", "img", "link", "base", "form"}


class Page(HTMLParser):
    def __init__(self):
        super().__init__()
        self.errors, self.doctype, self.open, self.figures, self.verdict = [], "", [], 0, []

    def handle_decl(self, decl):
        self.doctype = decl.lower()

    def handle_starttag(self, tag, attrs):
        attrs = dict(attrs)
        self.figures += tag == "figure"
        self.verdict += [attrs.get("data-verdict")] if attrs.get("id") == "verdict" else []
        if tag in FORBIDDEN or any(n.startswith("on") or (n in ("href", "src") and not (v or "").startswith("#"))
                                   or re.search(r"url\((?!#)|@import", v or "") for n, v in attrs.items()):
            self.errors.append("line %d: <%s> runs or loads something" % (self.getpos()[0], tag))
        if tag not in VOID:
            self.open.append(tag)

    def handle_startendtag(self, tag, attrs):
        self.handle_starttag(tag, attrs)
        self.open.pop() if tag not in VOID else None

    def handle_endtag(self, tag):
        if self.open[-1:] != [tag]:
            self.errors.append("line %d: </%s> closes <%s>" % (self.getpos()[0], tag, self.open[-1:]))
        self.open = self.open[:-1]

    def handle_data(self, data):
        if self.open[-1:] == ["style"] and re.search(r"url\((?!#)|@import", data):
            self.errors.append("the style sheet loads something from outside the page")


parser = argparse.ArgumentParser()
parser.add_argument("file")
parser.add_argument("--figures", type=int, required=True)
parser.add_argument("--verdict", required=True)
args = parser.parse_args()
page = Page()
page.feed(open(args.file, "rb").read().decode("utf-8"))  # not UTF-8: UnicodeDecodeError, exit 1
page.close()
errors = page.errors + ["no <!DOCTYPE html>"] * (page.doctype != "doctype html")
errors += ["<%s> left open" % "> <".join(page.open)] * bool(page.open)
errors += ["%d figures, verdict %r" % (page.figures, page.verdict)] * (
    page.figures != args.figures or page.verdict != [args.verdict])
print("\n".join("check_report: " + e for e in errors) or "check_report: OK")
sys.exit(1 if errors else 0)
