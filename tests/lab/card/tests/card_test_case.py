"""Tests that begin with new cards."""

import tempfile
import unittest
from pathlib import Path

import bench
import card_folder
from card_folder import VirtualCard


class CardTestCase(unittest.TestCase):
    def setUp(self) -> None:
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.cards = Path(folder.name)

    def load(self, name: str) -> VirtualCard:
        """The card as it comes out of the drawer, with what its folder remembers."""
        return card_folder.load(bench.copy_card(name, self.cards))

    def talk_selected(self, card: VirtualCard) -> bench.Talk:
        talk = bench.Talk(card)
        self.assertEqual(talk.status(bench.SELECT), 0x9000)
        return talk

    def talk_verified(self, card: VirtualCard) -> bench.Talk:
        talk = self.talk_selected(card)
        self.assertEqual(talk.verify(bench.PIN), 0x9000)
        return talk

    def selected(self, name: str) -> bench.Talk:
        return self.talk_selected(self.load(name))

    def verified(self, name: str) -> bench.Talk:
        return self.talk_verified(self.load(name))
