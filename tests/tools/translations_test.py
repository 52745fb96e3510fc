#!/usr/bin/python3
"""Tests tools/translations."""

import contextlib
import io
import pathlib
import sys
import tempfile
import unittest

import polib

ROOT = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(ROOT / "tools/translations"))
import extraction
import translations


def run(*arguments):
    """Returns the exit code and what the tool prints."""
    output = io.StringIO()
    sys.argv = ["translations.py", *map(str, arguments)]
    with contextlib.redirect_stdout(output), contextlib.redirect_stderr(output):
        return translations.main(), output.getvalue()


class Translations(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = pathlib.Path(folder.name)

    def test_texts_are_found_in_every_form(self):
        (self.folder / "a.cpp").write_text(
            """
            // localize("peru.comment", "no")
            x = localize("peru.a", "one " /* and */
                         "two\\n\\"", {{"%FILE%", f}});
            constexpr SText kText{"peru.b", "three"};
            throwError(condition ? "peru.c" : "peru.d", condition ? "four" : "five", 'a');
            use(key("peru.e", u"six", "peru.f", "seven"), "peru.", "sonora2_wav");
            """
        )
        texts, faults = extraction.collect(self.folder, ["."])
        expected = {"a": 'one two\n"', "b": "three", "c": "four", "d": "five", "e": "six", "f": "seven"}
        self.assertEqual({key: text.default for key, text in texts.items()}, {f"peru.{k}": v for k, v in expected.items()})
        self.assertEqual(faults, [])
        (self.folder / "b.cpp").write_text('f("peru.a", "other"); g("peru.lost", value);')
        faults = extraction.collect(self.folder, ["."])[1]
        self.assertEqual(len(faults), 2, faults)

    def test_language_files_hold_everything(self):
        for file in sorted((ROOT / "po").glob("*.po")):
            with self.subTest(file.name):
                po = polib.pofile(str(file))
                po[3].flags.append("fuzzy")
                po[4].tcomment = "a remark"
                po.save(str(self.folder / "in.po"))
                made = self.folder / file.stem
                self.assertEqual(run("pack", "-o", made, self.folder / "in.po"), (0, ""))
                self.assertEqual(run("unpack", "-o", self.folder / "out.po", *made.iterdir()), (0, ""))
                back = polib.pofile(str(self.folder / "out.po"))
                fields = lambda entry: (entry.msgctxt, entry.msgid, entry.msgstr, entry.fuzzy, entry.tcomment)
                self.assertEqual(sorted(map(fields, back)), sorted(map(fields, po)))
                self.assertEqual({**back.metadata, **po.metadata}, back.metadata)

    def test_the_check_finds_faults(self):
        key, default = "peru.CSystem.CopyFileFailed", "Error copying file '%SRC%' to '%DEST%' (%MSG%)."
        cases = [
            (default, "%SRC%, %DEST%, %MSG%.", None),
            (default, "%SRC%, %DEST%.", "%MSG% is lost"),
            (default, "%SRC%, %DEST%, %MSG%, %FILE%.", "%FILE% is not in the default text"),
            (default, "%SRC%, %DEST%, %MSG%", "punctuation"),
            ("shell error %d", "%s", "conversions differ"),
            ("shell error %d", "100 %FILE% %d", "%FILE% is not in"),
            ("%d of %.3f in %s", "%3$s: %2$.3f, %1$d", None),
            ("%d of %.3f in %s", "%s: %.3f, %d", "conversions differ"),
            ("%d of %.3f in %s", "%3$s: %2$d, %1$.3f", "conversions differ"),
            ("%d of %d", "%1$d, %1$d", "conversions differ"),
            ("&Open", "Oeffnen", "accelerator"),
            ("Save\tCtrl+S", "Speichern\tStrg+S", None),
        ]
        for default, translation, fault in cases:
            found = translations.check_entry(default, translation)
            self.assertEqual(bool(found), bool(fault), found)
            self.assertIn(fault or "", " ".join(found))
        po = polib.pofile(str(ROOT / "po/de.po"))
        entry = po.find(key, by="msgctxt")
        entry.msgstr = "%SRC%."
        po.remove(po.find("peru.HexData.parseError", by="msgctxt"))
        po.append(polib.POEntry(msgctxt="peru.unknown", msgid="a", msgstr="b"))
        po.save(str(self.folder / "de.po"))
        code, output = run("check", self.folder / "de.po")
        self.assertEqual(code, 1)
        for line in ("%DEST% is lost", "peru.HexData.parseError is not translated", "peru.unknown: no such text"):
            self.assertIn(line, output)


if __name__ == "__main__":
    unittest.main()
