"""Follows the links in the given Markdown, HTML and JavaScript files: each target has to exist, and to have the heading or
anchor that the link names. Links to other hosts are left alone."""

import html.parser
import pathlib
import re
import sys
import urllib.parse


class Page(html.parser.HTMLParser):
    def __init__(self, text):
        super().__init__()
        self.links, self.anchors = [], set()
        self.feed(text)

    def handle_starttag(self, tag, attributes):
        for name, value in attributes:
            if name in ("href", "src"):
                self.links.append(value or "")
            elif name in ("id", "name"):
                self.anchors.add(value)


class Markdown:
    def __init__(self, text):
        text = re.sub(r"^ *```.*?^ *```", "", text, flags=re.MULTILINE | re.DOTALL)
        headings = re.findall(r"^#+ (.*)", text, re.MULTILINE)
        self.links = re.findall(r"\]\(([^)\s]+)\)", text)
        self.anchors = {re.sub(r"[^\w -]", "", heading.lower()).replace(" ", "-") for heading in headings}


class Script:  # of Doxygen: the trees of its menu, and the lists of its search
    def __init__(self, text):
        self.links = re.findall(r"['\"]((?:\.\./)?\w+\.html(?:#\w*)?)['\"]", text)
        self.anchors = set()


KINDS = {".html": Page, ".md": Markdown, ".js": Script}
read = {}


def content(path):
    if path not in read:
        read[path] = KINDS[path.suffix](path.read_text())
    return read[path]


dead = count = 0
for argument in sys.argv[1:]:
    path = pathlib.Path(argument).resolve()
    for link in content(path).links:
        url = urllib.parse.urlsplit(link)
        if url.scheme or link.startswith(("$", "'")):  # other hosts, and text that a script completes
            continue
        count += 1
        target = (path.parent / urllib.parse.unquote(url.path)).resolve() if url.path else path
        if not target.exists() or (url.fragment and target.suffix in (".html", ".md") and
                                   urllib.parse.unquote(url.fragment) not in content(target).anchors):
            print(f"{argument} links to {link}, which does not exist")
            dead += 1
print(f"{count} links, {dead} dead")
sys.exit(dead != 0 or count == 0)
