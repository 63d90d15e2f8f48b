"""The README's settings and logging tables against what the code reads."""
import pathlib
import re
import sys
import unittest

ROOT = pathlib.Path(__file__).resolve().parents[2]


def code_files():
    for folder in ("src", "apps"):
        yield from (ROOT / folder).rglob("*.cpp")
        yield from (ROOT / folder).rglob("*.h")


def readme_section(title):
    text = (ROOT / "README.md").read_text(encoding="utf-8")
    start = text.index("\n## " + title + "\n")
    end = text.find("\n## ", start + 1)
    return text[start:end if end >= 0 else len(text)]


def table_rows(section):
    rows = []
    for line in section.splitlines():
        if line.startswith("| `"):
            rows.append([cell.strip().strip("`") for cell in line.strip("|").split("|")])
    return rows


class SettingsTable(unittest.TestCase):
    def setUp(self):
        self.section = readme_section("Settings")
        table = (ROOT / "src/platform/sitesettings.cpp").read_text(encoding="utf-8")
        self.entries = re.findall(r'\{ S::\w+, u"(\w+)", u"(\w+)", u"(LUDMOX_\w+)" \}', table)
        self.assertGreater(len(self.entries), 10, "the settings table was not found")

    def test_every_setting_is_a_row(self):
        rows = {tuple(row[:3]) for row in table_rows(self.section) if len(row) >= 5}
        self.assertEqual(rows, set(self.entries))

    def test_every_variable_the_code_reads_is_documented(self):
        variables = set()
        for path in code_files():
            variables.update(re.findall(r'"(LUDMOX_[A-Z_]+)"', path.read_text(encoding="utf-8")))
        variables.update(variable for _, _, variable in self.entries)
        missing = sorted(v for v in variables if "`" + v + "`" not in self.section)
        self.assertEqual(missing, [])

    def test_every_logging_category_is_documented(self):
        categories = set()
        for path in code_files():
            categories.update(re.findall(r'Q_LOGGING_CATEGORY\(\w+,\s*"([\w.]+)"',
                                         path.read_text(encoding="utf-8")))
        documented = {row[0] for row in table_rows(self.section) if len(row) == 2}
        self.assertEqual(documented, categories)


if __name__ == "__main__":
    sys.exit(unittest.main())
