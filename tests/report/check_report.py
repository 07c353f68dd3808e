#!/usr/bin/env python3
"""Checks the structure of a calibration report page with a real HTML parser.

Usage: check_report.py FILE [--expect ID=TEXT]... [--section ID]... [--absent ID]...
                            [--figures N] [--verdict pass|fail|incomplete|xtest]

Always checked: UTF-8 text; a doctype, html lang, meta charset, a title;
every element closed in order (void elements excepted, SVG elements may close
themselves); no scripts, event handlers, frames, images, style sheet links or
imports, and no reference outside the page (href only to "#id" of an element
that exists); unique ids; every figure has one inline SVG with a viewBox, an
accessible name and a legend, and a caption.
Then each --expect compares the text of the element with that id (white space
collapsed), each --section / --absent asks for a section to be there or not,
--figures counts the figures and --verdict reads the verdict.
Prints "check_report: OK" or every problem found, and exits 0 or 1.
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
        self.tag, self.attrs, self.parent = tag, dict(attrs), parent
        self.children, self.text = [], []

    def all_text(self):
        parts = list(self.text)
        for child in self.children:
            parts.append(child.all_text())
        return "".join(parts)

    def walk(self):
        yield self
        for child in self.children:
            yield from child.walk()

    def classes(self):
        return (self.attrs.get("class") or "").split()


class Page(HTMLParser):
    def __init__(self):
        super().__init__(convert_charrefs=True)
        self.root = Node("#document", [], None)
        self.current = self.root
        self.errors = []
        self.doctype = None
        self.styles = []

    def error_at(self, text):
        line, column = self.getpos()
        self.errors.append("line %d, column %d: %s" % (line, column + 1, text))

    def handle_decl(self, decl):
        self.doctype = decl

    def handle_starttag(self, tag, attrs):
        self.open(tag, attrs, closes_itself=False)

    def handle_startendtag(self, tag, attrs):
        self.open(tag, attrs, closes_itself=True)

    def open(self, tag, attrs, closes_itself):
        if tag in FORBIDDEN:
            self.error_at("forbidden element <%s>" % tag)
        for name, value in attrs:
            if name.startswith("on"):
                self.error_at("event handler %s on <%s>" % (name, tag))
            if name in ("href", "xlink:href", "src", "action", "formaction", "srcset"):
                if not (value or "").startswith("#"):
                    self.error_at("reference outside the page: %s=%r" % (name, value))
            if name == "style" and value and re.search(r"url\(|@import|expression", value):
                self.error_at("inline style loads something: %r" % value)
        node = Node(tag, attrs, self.current)
        self.current.children.append(node)
        in_svg = any(n.tag == "svg" for n in self.ancestors(node))
        if closes_itself and not (tag in VOID or in_svg):
            self.error_at("<%s/> is not a void element" % tag)
        if not closes_itself and tag not in VOID:
            self.current = node

    def ancestors(self, node):
        while node is not None:
            yield node
            node = node.parent

    def handle_endtag(self, tag):
        if tag in VOID:
            self.error_at("end tag of void element </%s>" % tag)
            return
        if self.current.tag != tag:
            self.error_at("</%s> closes <%s>" % (tag, self.current.tag))
            # Recover at the nearest matching open element, if any.
            for node in self.ancestors(self.current):
                if node.tag == tag:
                    self.current = node.parent
                    break
            return
        self.current = self.current.parent

    def handle_data(self, data):
        self.current.text.append(data)
        if self.current.tag == "style":
            self.styles.append(data)


def check_structure(page, errors):
    if not page.doctype or page.doctype.lower() != "doctype html":
        errors.append("no <!DOCTYPE html>")
    if page.current is not page.root:
        errors.append("unclosed element <%s> at the end" % page.current.tag)
    nodes = list(page.root.walk())
    html = [n for n in nodes if n.tag == "html"]
    if len(html) != 1 or not html[0].attrs.get("lang"):
        errors.append("one <html> with a lang attribute expected")
    if not any(n.tag == "meta" and (n.attrs.get("charset") or "").lower() == "utf-8"
               for n in nodes):
        errors.append("no <meta charset=\"utf-8\">")
    titles = [n for n in nodes if n.tag == "title" and n.parent.tag == "head"]
    if len(titles) != 1 or not titles[0].all_text().strip():
        errors.append("one non-empty <title> expected")
    for style in page.styles:
        if re.search(r"@import|url\((?!#)", style):
            errors.append("the style sheet loads something from outside the page")

    ids = {}
    for node in nodes:
        if "id" in node.attrs:
            if node.attrs["id"] in ids:
                errors.append("duplicate id %r" % node.attrs["id"])
            ids[node.attrs["id"]] = node
    for node in nodes:
        for name in ("href", "xlink:href"):
            value = node.attrs.get(name)
            if value and value.startswith("#") and value[1:] not in ids:
                errors.append("%s=%r points at no element" % (name, value))

    for figure in (n for n in nodes if n.tag == "figure"):
        label = figure.attrs.get("id", "a figure")
        drawings = [n for n in figure.walk() if n.tag == "svg"]
        if len(drawings) != 1:
            errors.append("%s: one inline <svg> expected, found %d" % (label, len(drawings)))
            continue
        svg = drawings[0]
        if not re.fullmatch(r"-?[\d.]+ -?[\d.]+ [\d.]+ [\d.]+", svg.attrs.get("viewbox", "")):
            errors.append("%s: the drawing has no viewBox" % label)
        if not svg.attrs.get("aria-label"):
            errors.append("%s: the drawing has no accessible name" % label)
        if not any("legend" in n.classes() for n in svg.walk()):
            errors.append("%s: the drawing has no legend" % label)
        captions = [n for n in figure.children if n.tag == "figcaption"]
        if len(captions) != 1 or not captions[0].all_text().strip():
            errors.append("%s: one caption expected" % label)
    return ids, nodes


def collapse(text):
    return " ".join(text.split())


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("file")
    parser.add_argument("--expect", action="append", default=[], metavar="ID=TEXT")
    parser.add_argument("--section", action="append", default=[])
    parser.add_argument("--absent", action="append", default=[])
    parser.add_argument("--figures", type=int)
    parser.add_argument("--verdict")
    args = parser.parse_args()

    errors = []
    with open(args.file, "rb") as f:
        raw = f.read()
    try:
        text = raw.decode("utf-8")
    except UnicodeDecodeError as error:
        print("check_report: not UTF-8: %s" % error)
        return 1
    page = Page()
    page.feed(text)
    page.close()
    errors.extend(page.errors)
    ids, nodes = check_structure(page, errors)

    for expectation in args.expect:
        key, _, wanted = expectation.partition("=")
        if key not in ids:
            errors.append("no element with id %r" % key)
        elif collapse(ids[key].all_text()) != collapse(wanted):
            errors.append("#%s reads %r, expected %r" % (key, collapse(ids[key].all_text()),
                                                         collapse(wanted)))
    sections = {n.attrs.get("id") for n in nodes if n.tag == "section"}
    for name in args.section:
        if name not in sections:
            errors.append("no section %r" % name)
    for name in args.absent:
        if name in ids:
            errors.append("%r should be absent" % name)
    if args.figures is not None:
        count = sum(1 for n in nodes if n.tag == "figure")
        if count != args.figures:
            errors.append("%d figures, expected %d" % (count, args.figures))
    if args.verdict is not None:
        verdict = ids.get("verdict")
        found = verdict.attrs.get("data-verdict") if verdict else None
        if found != args.verdict:
            errors.append("verdict %r, expected %r" % (found, args.verdict))

    for error in errors:
        print("check_report: %s" % error)
    if errors:
        return 1
    print("check_report: OK")
    return 0


if __name__ == "__main__":
    sys.exit(main())
