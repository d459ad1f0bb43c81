"""Follows the links in the given Markdown, HTML and JavaScript files: each target has to exist, and to have the heading or
anchor that the link names. Links to other hosts are left alone."""
import functools
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


@functools.cache
def links_and_anchors(path):
    text = path.read_text()
    if path.suffix == ".html":
        page = Page(text)
        return page.links, page.anchors
    if path.suffix == ".md":
        text = re.sub(r"^ *```.*?^ *```", "", text, flags=re.MULTILINE | re.DOTALL)
        headings = re.findall(r"^#+ (.*)", text, re.MULTILINE)
        return (re.findall(r"\]\(([^)\s]+)\)", text),
                {re.sub(r"[^\w -]", "", heading.lower()).replace(" ", "-") for heading in headings})
    # A script of Doxygen's: the trees of its menu, or the lists of its search.
    return re.findall(r"['\"]((?:\.\./)?\w+\.html(?:#\w*)?)['\"]", text), set()


dead = count = 0
for argument in sys.argv[1:]:
    path = pathlib.Path(argument).resolve()
    for link in links_and_anchors(path)[0]:
        url = urllib.parse.urlsplit(link)
        if url.scheme or link.startswith(("$", "'")):  # another host, or text that a script completes
            continue
        count += 1
        target = (path.parent / urllib.parse.unquote(url.path)).resolve() if url.path else path
        if not target.exists() or (url.fragment and target.suffix in (".html", ".md") and
                                   urllib.parse.unquote(url.fragment) not in links_and_anchors(target)[1]):
            print(f"{argument} links to {link}, which does not exist")
            dead += 1
print(f"{count} links, {dead} dead")
sys.exit(dead != 0 or count == 0)
