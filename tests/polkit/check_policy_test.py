#!/usr/bin/env python3
"""The check finds each kind of fault: check_policy_test.py FILE

The file must pass as it is, and fail with one fault at a time.
"""

import sys
import unittest
from pathlib import Path

from check_policy import problems_of

POLICY = Path(sys.argv.pop(1)).read_text(encoding="utf-8")

# What is put in the place of what.
FAULTS = {
    "a word that polkit does not know": (">auth_admin_keep<", ">auth_admin_keeep<"),
    "a word in capitals": (">auth_admin_keep<", ">Auth_Admin_Keep<"),
    "a word with a space": (">auth_admin_keep<", "> auth_admin_keep<"),
    "nobody is asked": (">auth_admin_keep<", ">yes<"),
    "the user's own password": (">auth_admin_keep<", ">auth_self_keep<"),
    "the right is not kept": (">auth_admin_keep<", ">auth_admin<"),
    "anybody": ("<allow_any>no<", "<allow_any>auth_admin<"),
    "an inactive session": ("<allow_inactive>no<", "<allow_inactive>yes<"),
    "an empty word": ("<allow_any>no<", "<allow_any><"),
    "no word": ("<allow_any>no</allow_any>", ""),
    "a word twice": ("<allow_any>no</allow_any>", "<allow_any>no</allow_any>" * 2),
    "a misspelled element": ("allow_inactive", "allow_inactiv"),
    "no defaults": ("defaults>", "default>"),
    "another action": ('id="org.vlm.vlmbind.admin"', 'id="org.vlm.vlmbind.admins"'),
    "a second action": ("</action>", "</action><action id='org.vlm.vlmbind.other'/>"),
    "an annotation": (
        "<defaults>",
        "<annotate key='org.freedesktop.policykit.imply'>org.vlm</annotate><defaults>",
    ),
    "another vendor": ("<vendor>vlmbind<", "<vendor>Somebody<"),
    "a language too few": ('<message xml:lang="ja">', '<message xml:lang="ko">'),
    "a language twice": ('<message xml:lang="ja">', '<message xml:lang="de">'),
    "no English": ("<message>", '<message xml:lang="en">'),
    "an empty text": ("إقران بطاقة ذكية بحساب", ""),
    "a text that is not translated": (
        "Associare una smart card a un account",
        "Pair a smart card with an account",
    ),
    "a text with a variable": ("your account<", "$(account)<"),
    "text beside the elements": ("<defaults>", "yes<defaults>"),
    "not well-formed": ("</vendor>", ""),
    "cut off": ("</policyconfig>", ""),
}


class CheckPolicy(unittest.TestCase):
    def test_the_file_is_as_it_should_be(self) -> None:
        self.assertEqual(problems_of(POLICY.encode()), [])

    def test_each_fault_is_found(self) -> None:
        for why, (place, fault) in FAULTS.items():
            with self.subTest(why):
                faulty = POLICY.replace(place, fault)
                self.assertNotEqual(faulty, POLICY, "the fault is nowhere in the file")
                self.assertNotEqual(problems_of(faulty.encode()), [])


if __name__ == "__main__":
    unittest.main()
