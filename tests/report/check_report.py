#!/usr/bin/env python3
"""Checks the structure of a report page the tool wrote, with a real HTML parser.

Usage: check_report.py FILE [--figures N] [--verdict pass|fail|incomplete|xtest]

The report tests compare pages byte for byte with reviewed copies; this is
the net under those copies and under the example's page in CI: UTF-8, a
doctype, html lang, meta charset and title; elements closed in order (void
elements excepted, SVG elements may close themselves); no scripts, frames,
images, event handlers or references outside the page; unique ids; each
figure holds one SVG with a viewBox, an accessible name and a legend, and a
caption. Prints "check_report: OK" or every problem, and exits 0 or 1.
"""

import argparse
import re
import sys
from html.parser import HTMLParser

VOID = {"area", "base", "br", "col", "embed", "hr", "img", "input", "link", "meta", "source",
        "track", "wbr"}
FORBIDDEN = {"script", "iframe", "frame", "object", "embed", "img", "link", "audio", "video",
             "base", "form", "input"}


class Node:
    def __init__(self, tag, attrs, parent):
        self.tag, self.attrs, self.parent, self.children = tag, dict(attrs), parent, []
        self.text = ""

    def walk(self):
        yield self
        for child in self.children:
            yield from child.walk()


class Page(HTMLParser):
    def __init__(self):
        super().__init__(convert_charrefs=True)
        self.root = self.current = Node("#document", [], None)
        self.errors, self.doctype, self.svg_depth = [], "", 0

    def error(self, text):
        self.errors.append("line %d: %s" % (self.getpos()[0], text))

    def handle_decl(self, decl):
        self.doctype = decl.lower()

    def handle_starttag(self, tag, attrs, closes_itself=False):
        if tag in FORBIDDEN:
            self.error("forbidden element <%s>" % tag)
        for name, value in attrs:
            if name.startswith("on") or (name in ("href", "xlink:href", "src", "action", "srcset")
                                         and not (value or "").startswith("#")):
                self.error("%s=%r on <%s>" % (name, value, tag))
        if closes_itself and tag not in VOID and not any(
                n.tag == "svg" for n in self.walk_up(self.current)):
            self.error("<%s/> is not a void element" % tag)
        node = Node(tag, attrs, self.current)
        self.current.children.append(node)
        if not closes_itself and tag not in VOID:
            self.current = node

    def handle_startendtag(self, tag, attrs):
        self.handle_starttag(tag, attrs, closes_itself=True)

    def walk_up(self, node):
        while node is not None:
            yield node
            node = node.parent

    def handle_endtag(self, tag):
        if self.current.tag != tag:
            self.error("</%s> closes <%s>" % (tag, self.current.tag))
        else:
            self.current = self.current.parent

    def handle_data(self, data):
        self.current.text += data
        if re.search(r"@import|url\((?!#)", data) and self.current.tag == "style":
            self.error("the style sheet loads something from outside the page")


def problems(page, args):
    errors = list(page.errors)
    nodes = list(page.root.walk())
    named = lambda tag, test: [n for n in nodes if n.tag == tag and test(n)]
    if page.doctype != "doctype html" or page.current is not page.root:
        errors.append("no <!DOCTYPE html> or an element left open")
    if len(named("html", lambda n: n.attrs.get("lang"))) != 1 or not named(
            "meta", lambda n: (n.attrs.get("charset") or "").lower() == "utf-8"):
        errors.append("one <html lang> and a <meta charset=\"utf-8\"> expected")
    if len(named("title", lambda n: n.parent.tag == "head" and n.text.strip())) != 1:
        errors.append("one non-empty <title> expected")
    ids = [n.attrs["id"] for n in nodes if "id" in n.attrs]
    errors += ["duplicate id %r" % i for i in sorted({i for i in ids if ids.count(i) > 1})]
    errors += ["%r points at no element" % n.attrs[a] for n in nodes for a in ("href", "xlink:href")
               if (n.attrs.get(a) or "#")[1:] not in ids + [""]]
    figures = named("figure", lambda n: True)
    for figure in figures:
        svg = [n for n in figure.walk() if n.tag == "svg"]
        if len(svg) != 1 or not re.fullmatch(r"-?[\d.]+ -?[\d.]+ [\d.]+ [\d.]+",
                                             svg[0].attrs.get("viewbox", "")) \
                or not svg[0].attrs.get("aria-label") \
                or not any("legend" in (n.attrs.get("class") or "").split() for n in svg[0].walk()) \
                or len([n for n in figure.children if n.tag == "figcaption"]) != 1:
            errors.append("%s: one SVG with a viewBox, a name and a legend, and a caption expected"
                          % figure.attrs.get("id", "a figure"))
    if args.figures is not None and len(figures) != args.figures:
        errors.append("%d figures, expected %d" % (len(figures), args.figures))
    verdict = [n.attrs.get("data-verdict") for n in nodes if n.attrs.get("id") == "verdict"]
    if args.verdict is not None and verdict != [args.verdict]:
        errors.append("verdict %r, expected %r" % (verdict, args.verdict))
    return errors


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
    errors = problems(page, args)
    for error in errors:
        print("check_report: %s" % error)
    print("check_report: OK" if not errors else "check_report: %d problem(s)" % len(errors))
    return 1 if errors else 0


if __name__ == "__main__":
    sys.exit(main())
