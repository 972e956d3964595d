"""The links of the documents lead to files and headings that are there."""

import gzip
import shutil

from harness import TREE
from links import dead_links


def test_the_documents_of_the_tree(tmp_path):
    for page in TREE.glob("*.md"):
        shutil.copy(page, tmp_path)
    shutil.copytree(TREE / "docs", tmp_path / "docs")
    assert dead_links(tmp_path) == []


def test_what_is_dead(tmp_path):
    (tmp_path / "page.md").write_text(
        "# A `page`: one\n## Twice\n## Twice\n[self](#a-page-one) [again](#twice-1) [no](#two) "
        "[more](more.md#its-part) [none](none.md) [part](more.md#no-part) [far](https://none.md)\n"
        "![picture](none.png)\n```\n# code\n[code](code.md)\n```\n")
    (tmp_path / "more.md.gz").write_bytes(gzip.compress(b"# Its part\n[back](page.md#code)\n"))
    assert dead_links(tmp_path) == ["page.md: #two", "page.md: none.md", "page.md: more.md#no-part",
                                    "page.md: none.png", "more.md.gz: page.md#code"]
