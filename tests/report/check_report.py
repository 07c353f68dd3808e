#!/usr/bin/env python3
"""Checks a report page the tool wrote with a real HTML parser.

Usage: check_report.py FILE [--figures N] [--verdict pass|fail|incomplete|xtest]

The report tests compare their pages byte for byte with reviewed copies; CI
runs this on the example's page, and it is the net when those copies are
regenerated: UTF-8 with a doctype; elements closed in order (void elements
excepted, SVG elements may close themselves); nothing that runs or loads
(scripts, frames, images, forms, event handlers, references or style imports
outside the page); unique ids; each figure with one inline SVG; the figure
count and the verdict. Prints "check_report: OK" or every problem; exits 0 or 1.
"""

import argparse
import re
import sys
from html.parser import HTMLParser

VOID = {"area", "br", "col", "hr", "meta", "source", "track", "wbr"}
FORBIDDEN = {"script", "iframe", "frame", "object", "embed", "img", "link", "audio", "video",
             "base", "form", "input"}


class Page(HTMLParser):
    def __init__(self):
        super().__init__(convert_charrefs=True)
        self.errors, self.doctype, self.open, self.ids = [], "", [], []
        self.figures, self.verdict = [], []

    def error(self, text):
        self.errors.append("line %d: %s" % (self.getpos()[0], text))

    def handle_decl(self, decl):
        self.doctype = decl.lower()

    def handle_starttag(self, tag, attrs, closes_itself=False):
        attrs = dict(attrs)
        if tag in FORBIDDEN:
            self.error("forbidden element <%s>" % tag)
        for name, value in attrs.items():
            if name.startswith("on") or (name in ("href", "xlink:href", "src", "action", "srcset")
                                         and not (value or "").startswith("#")) or (
                    name == "style" and re.search(r"url\(|@import", value or "")):
                self.error("%s=%r on <%s>" % (name, value, tag))
        self.ids += [attrs["id"]] if "id" in attrs else []
        if attrs.get("id") == "verdict":
            self.verdict.append(attrs.get("data-verdict"))
        if tag == "figure":
            self.figures.append(0)
        if tag == "svg" and "figure" in self.open:
            self.figures[-1] += 1
        if closes_itself and tag not in VOID and "svg" not in self.open:
            self.error("<%s/> is not a void element" % tag)
        if not closes_itself and tag not in VOID:
            self.open.append(tag)

    def handle_startendtag(self, tag, attrs):
        self.handle_starttag(tag, attrs, closes_itself=True)

    def handle_endtag(self, tag):
        if not self.open or self.open[-1] != tag:
            self.error("</%s> closes <%s>" % (tag, self.open[-1] if self.open else ""))
        else:
            self.open.pop()

    def handle_data(self, data):
        if self.open and self.open[-1] == "style" and re.search(r"@import|url\((?!#)", data):
            self.error("the style sheet loads something from outside the page")


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("file")
    parser.add_argument("--figures", type=int)
    parser.add_argument("--verdict")
    args = parser.parse_args()
    try:
        text = open(args.file, "rb").read().decode("utf-8")
    except UnicodeDecodeError as error:
        print("check_report: not UTF-8: %s" % error)
        return 1
    page = Page()
    page.feed(text)
    page.close()
    errors = page.errors
    if page.doctype != "doctype html" or page.open:
        errors.append("no <!DOCTYPE html>, or <%s> left open" % "> <".join(page.open))
    errors += ["duplicate id %r" % i for i in sorted({i for i in page.ids if page.ids.count(i) > 1})]
    errors += ["a figure with %d drawings" % n for n in page.figures if n != 1]
    if args.figures is not None and len(page.figures) != args.figures:
        errors.append("%d figures, expected %d" % (len(page.figures), args.figures))
    if args.verdict is not None and page.verdict != [args.verdict]:
        errors.append("verdict %r, expected %r" % (page.verdict, args.verdict))
    for error in errors:
        print("check_report: %s" % error)
    print("check_report: OK" if not errors else "check_report: %d problem(s)" % len(errors))
    return 1 if errors else 0


if __name__ == "__main__":
    sys.exit(main())
