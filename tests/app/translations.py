#!/usr/bin/env python3
"""Every text of the programs is translated, in every language: compares the sources with the translations as the
translators' own tool does, on copies."""

import pathlib
import shutil
import subprocess
import sys
import tempfile
import unittest
from xml.etree import ElementTree

ROOT = pathlib.Path(__file__).resolve().parents[2]
LUPDATE = sys.argv.pop()


class Translations(unittest.TestCase):
    def test_no_text_of_the_agent_is_unfinished(self):
        self.check("app")

    def test_no_text_of_the_daemon_is_unfinished(self):
        self.check("server")

    def check(self, sources):
        files = sorted((ROOT / sources / "translations").glob("*.ts"))
        self.assertEqual([file.stem.split("_")[1] for file in files], ["ar", "de", "en", "es", "fr", "ja", "zh"])
        with tempfile.TemporaryDirectory() as folder:
            copies = [shutil.copy(file, folder) for file in files]
            subprocess.run([LUPDATE, "-silent", "-locations", "none", ROOT / sources, "-ts", *copies], check=True,
                           stderr=subprocess.DEVNULL)
            for copy in copies:
                messages = list(ElementTree.parse(copy).iter("message"))
                self.assertGreater(len(messages), 15)
                for message in messages:
                    translation = message.find("translation")
                    texts = [form.text for form in translation] or [translation.text]
                    with self.subTest(file=pathlib.Path(copy).name, source=message.find("source").text):
                        self.assertIsNone(translation.get("type"), "unfinished, or no longer used")
                        self.assertTrue(all(texts), "empty")


if __name__ == "__main__":
    unittest.main()
