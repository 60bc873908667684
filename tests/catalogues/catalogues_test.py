"""The texts in every language: complete, with the same places for values, and usable by keyboard.

catalogues_test.py SOURCE-TREE FOLDER-OF-COMPILED-CATALOGUES
"""

import gettext
import os
import re
import subprocess
import sys
import unittest
from pathlib import Path
from xml.etree import ElementTree

SOURCE = Path(sys.argv[1])
COMPILED = Path(sys.argv[2])

# How many values a text takes; all others take none.
VALUES = {"AUTH_ERROR": 1, "PAIRING_ERROR": 1}

# Those that may be in every language what they are in English.
INTERNATIONAL = {"OK", "QT_LAYOUT_DIRECTION"}

# What the program says after a pairing that does not open the login keyring, and why it refuses one.
ANNOUNCED = {"AUTH_ERROR", "STORE_UNLOCK_KEY_FAILED", "STORE_UNLOCK_KEY_FAILED_INFO"}


def texts(language: str) -> dict[str, str]:
    with (COMPILED / language / "LC_MESSAGES/Bind.mo").open("rb") as file:
        catalogue = gettext.GNUTranslations(file)
    return {key: text for key, text in catalogue._catalog.items() if key}


def keys_in_window() -> set[str]:
    window = ElementTree.parse(SOURCE / "resources/ui/BindDialog.ui")
    return {each.text for each in window.iter("string") if not each.get("notr")}


def keys_with_mnemonics() -> set[str]:
    """Of the buttons, and of the labels that lead to another part."""
    found = set()
    for widget in ElementTree.parse(SOURCE / "resources/ui/BindDialog.ui").iter("widget"):
        text = widget.find("property[@name='text']/string")
        leads = widget.find("property[@name='buddy']") is not None
        if leads or widget.get("class") == "QPushButton":
            found.add(text.text)
    return found


def keys_in_code() -> set[str]:
    sources = [file for floor in ("bind", "ui", "tool") for file in (SOURCE / floor).glob("*.cpp")]
    return {
        key for file in sources for key in re.findall(r'\btext\("([A-Z_]+)"\)', file.read_text())
    }


def mnemonic(text: str) -> str:
    return "".join(re.findall(r"&(\w)", text)).casefold()


LANGUAGES = sorted(
    folder.name for folder in (SOURCE / "resources/locale").iterdir() if folder.is_dir()
)
TEXTS = {language: texts(language) for language in LANGUAGES}
ENGLISH = TEXTS["en"]
EACH_TEXT = [
    (language, key, text) for language in LANGUAGES for key, text in TEXTS[language].items()
]


class Catalogues(unittest.TestCase):
    def test_are_there_in_nine_languages(self) -> None:
        self.assertEqual(LANGUAGES, ["ar", "de", "en", "es", "fr", "it", "ja", "pt_BR", "zh_CN"])

    def test_have_no_text_that_is_missing_or_uncertain(self) -> None:
        for language in LANGUAGES:
            ended = subprocess.run(
                ["msgfmt", "--statistics", "--output-file=/dev/null"]
                + [str(SOURCE / "resources/locale" / language / "Bind.po")],
                env=os.environ | {"LC_ALL": "C"},
                capture_output=True,
                text=True,
            )
            self.assertEqual(ended.stderr, f"{len(ENGLISH)} translated messages.\n", language)

    def test_hold_what_the_window_and_the_program_ask_for_and_nothing_else(self) -> None:
        asked = keys_in_window() | keys_in_code() | ANNOUNCED | {"QT_LAYOUT_DIRECTION"}
        for language in LANGUAGES:
            self.assertEqual(set(TEXTS[language]), asked, language)

    def test_have_a_place_for_each_value(self) -> None:
        for language, key, text in EACH_TEXT:
            self.assertEqual(text.count("{}"), VALUES.get(key, 0), (language, key))
            self.assertIsNone(re.search(r"[{}%]", text.replace("{}", "")), (language, key))

    def test_are_translated(self) -> None:
        for language, key, text in EACH_TEXT:
            if language != "en" and key not in INTERNATIONAL:
                self.assertNotEqual(text, ENGLISH[key], (language, key))

    def test_are_lines_without_spaces_around_them(self) -> None:
        for language, key, text in EACH_TEXT:
            self.assertEqual(text, text.strip(), (language, key))
            self.assertNotIn("\n", text, (language, key))

    def test_give_each_control_an_access_key_of_its_own(self) -> None:
        wanted = keys_with_mnemonics()
        self.assertEqual(len(wanted), 4)
        for language in LANGUAGES:
            access_keys = {mnemonic(TEXTS[language][key]) for key in wanted}
            self.assertEqual(len(access_keys), 4, language)
            self.assertTrue(all(len(key) == 1 for key in access_keys), (language, access_keys))

    def test_have_no_access_key_elsewhere(self) -> None:
        for language, key, text in EACH_TEXT:
            if key not in keys_with_mnemonics():
                self.assertNotIn("&", text, (language, key))

    def test_say_in_which_direction_they_are_written(self) -> None:
        for language in LANGUAGES:
            direction = "RTL" if language == "ar" else "LTR"
            self.assertEqual(TEXTS[language]["QT_LAYOUT_DIRECTION"], direction, language)

    def test_call_the_window_by_its_name(self) -> None:
        self.assertEqual(ENGLISH["BIND_DIALOG_TITLE"], "SmartCard Pairing")


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1])
