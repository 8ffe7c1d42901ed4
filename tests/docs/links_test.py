"""Every relative link and anchor in the documents resolves; the generated class pages are there after a build."""

import pathlib
import re
import sys
import unittest

SOURCE, BUILD = pathlib.Path(sys.argv.pop(1)), pathlib.Path(sys.argv.pop(1))
LINK = re.compile(r"\[[^\]\n]*\]\(([^)\s]+)\)")


def documents():
    return sorted([*SOURCE.glob("*.md"), *(SOURCE / "docs").glob("*.md"), *SOURCE.glob("*/README.md")])


def without_code(text):
    return re.sub(r"`[^`\n]*`", "", re.sub(r"^```.*?^```", "", text, flags=re.M | re.S))


def anchors(text):
    """The names that Markdown gives to headings: small letters, blanks as hyphens, no punctuation."""
    found = set()
    for heading in re.findall(r"^#+ (.*)$", re.sub(r"^```.*?^```", "", text, flags=re.M | re.S), re.M):
        found.add(re.sub(r"[^\w\- ]", "", heading.lower()).replace(" ", "-"))
    return found


def broken(path):
    """Links of a document that lead nowhere."""
    text = path.read_text(encoding="utf-8")
    for target in LINK.findall(without_code(text)):
        if re.match(r"[a-z]+:", target):
            continue
        name, _, anchor = target.partition("#")
        where = path
        if name:
            where = (path.parent / name).resolve()
            release = (SOURCE / "build/release").resolve()
            if release in where.parents:
                where = BUILD / where.relative_to(release)
        if not where.exists():
            yield f"{path.name}: {target} is not there"
        elif anchor and anchor not in anchors(where.read_text(encoding="utf-8")):
            yield f"{path.name}: {target} has no such heading"


class Links(unittest.TestCase):
    def test_all_of_the_documents_lead_somewhere(self):
        self.assertGreater(len(documents()), 8)
        self.assertEqual([fault for path in documents() for fault in broken(path)], [])

    def test_the_readme_links_every_page(self):
        readme = (SOURCE / "README.md").read_text(encoding="utf-8")
        for page in (SOURCE / "docs").glob("*.md"):
            self.assertIn(f"docs/{page.name}", readme)

    def test_a_broken_one_is_found(self):
        page = BUILD / "docs_links_test.md"
        page.write_text("# A heading\n[a](#a-heading) [b](nowhere.md) [c](#nowhere) `[d](nowhere)`\n", encoding="utf-8")
        self.addCleanup(page.unlink)
        self.assertEqual(list(broken(page)), ["docs_links_test.md: nowhere.md is not there",
                                              "docs_links_test.md: #nowhere has no such heading"])

    def test_the_class_pages_link_each_other(self):
        pages = sorted((BUILD / "docs/classes").glob("*.md"))
        self.assertGreater(len(pages), 260)
        self.assertEqual([fault for page in pages for fault in broken(page)], [])


if __name__ == "__main__":
    unittest.main()
