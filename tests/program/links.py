"""Finds the dead links of documents: relative links of Markdown pages to a file or a heading that isn't
there."""

import gzip
import re

LINK = re.compile(r"\]\(([^()\s]+)\)")
HEADING = re.compile(r"#+ +(.*)")
FENCE = re.compile(r"^(```+)[^\n]*\n.*?^\1$", re.DOTALL | re.MULTILINE)


def find_page(path):
    """The page, or the packed one that a distribution makes of it. None without either."""
    return next((each for each in (path, path.with_name(path.name + ".gz")) if each.exists()), None)


def read_page(path):
    data = path.read_bytes()
    text = (gzip.decompress(data) if path.suffix == ".gz" else data).decode("utf-8")
    return FENCE.sub("", text)


def anchors_of(page):
    """The anchors of the headings, as the usual viewers make them."""
    found = []
    for line in read_page(page).splitlines():
        if heading := HEADING.fullmatch(line):
            anchor = re.sub(r"[^\w\- ]", "", heading.group(1).strip().lower()).replace(" ", "-")
            found.append(f"{anchor}-{found.count(anchor)}" if anchor in found else anchor)
    return set(found)


def dead_links_of(page):
    for link in LINK.findall(read_page(page)):
        if re.match(r"\w+:", link):
            continue
        name, _, anchor = link.partition("#")
        target = find_page(page.parent / name) if name else page
        if target is None or (anchor and anchor not in anchors_of(target)):
            yield link


def dead_links(root):
    """The dead links of the pages below this folder, each with its page."""
    pages = [path for pattern in ("*.md", "*.md.gz") for path in sorted(root.rglob(pattern))]
    assert pages, f"no page in {root}"
    return [f"{page.relative_to(root)}: {link}" for page in pages for link in dead_links_of(page)]
