#!/usr/bin/env python3
"""Reads an exported workbook or HTML file with libraries other than the writers and
prints what a test needs to know as JSON.

    writers_check.py xlsx FILE   cells (value, type, number format), outline levels,
                                 frozen panes, column widths, page breaks
    writers_check.py html FILE   title, tables with their rows of cell texts, links,
                                 images and every element name seen
"""
import json
import sys
from html.parser import HTMLParser


def read_xlsx(path):
    import openpyxl

    # A file object: openpyxl judges a path by its extension, and the writer keeps the
    # caller's name whatever it is.
    with open(path, "rb") as f:
        book = openpyxl.load_workbook(f)
    sheet = book.worksheets[0]
    rows = []
    for row in sheet.iter_rows():
        cells = []
        for cell in row:
            value = cell.value
            if hasattr(value, "isoformat"):
                value = value.isoformat()
            cells.append({"value": value, "type": cell.data_type,
                          "format": cell.number_format})
        rows.append(cells)
    levels = {str(i): d.outline_level for i, d in sheet.row_dimensions.items()}
    widths = {k: d.width for k, d in sheet.column_dimensions.items() if d.width}
    breaks = [b.id for b in sheet.row_breaks.brk]
    return {"sheet": sheet.title, "rows": rows, "levels": levels,
            "freeze": sheet.freeze_panes, "widths": widths, "breaks": breaks}


class Html(HTMLParser):
    def __init__(self):
        super().__init__(convert_charrefs=True)
        self.title = ""
        self.tables = []
        self.links = []
        self.images = []
        self.elements = set()
        self.stack = []
        self.cell = None

    def handle_starttag(self, tag, attrs):
        self.elements.add(tag)
        attrs = dict(attrs)
        self.stack.append(tag)
        if tag == "table":
            self.tables.append([])
        elif tag == "tr" and self.tables:
            self.tables[-1].append([])
        elif tag == "td":
            self.cell = ""
        elif tag == "br" and self.cell is not None:
            self.cell += "\n"
        elif tag == "a":
            self.links.append({"href": attrs.get("href"), "rel": attrs.get("rel"), "text": ""})
        elif tag == "img":
            self.images.append(attrs.get("src", "")[:40])
        if tag in ("br", "col", "meta", "img"):
            self.stack.pop()

    def handle_endtag(self, tag):
        if self.stack and self.stack[-1] == tag:
            self.stack.pop()
        if tag == "td" and self.cell is not None and self.tables and self.tables[-1]:
            self.tables[-1][-1].append(self.cell)
            self.cell = None

    def handle_data(self, data):
        if self.stack and self.stack[-1] == "title":
            self.title += data
        if self.cell is not None:
            self.cell += data
        if self.stack and self.stack[-1] == "a" and self.links:
            self.links[-1]["text"] += data


def read_html(path):
    parser = Html()
    with open(path, encoding="utf-8") as f:
        parser.feed(f.read())
    parser.close()
    return {"title": parser.title, "tables": parser.tables, "links": parser.links,
            "images": parser.images, "elements": sorted(parser.elements),
            "unclosed": parser.stack}


if __name__ == "__main__":
    kind, path = sys.argv[1], sys.argv[2]
    print(json.dumps(read_xlsx(path) if kind == "xlsx" else read_html(path)))
