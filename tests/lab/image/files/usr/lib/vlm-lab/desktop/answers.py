"""How somebody who is asked shall answer, and the record of what was asked.

A test writes the answer into /run/vlm-lab/WHO before it is needed, and reads the questions, one JSON
object a line, from /run/vlm-lab/WHO.asked. Nobody who was not told to agree does.
"""

import json
from pathlib import Path

FOLDER = Path("/run/vlm-lab")
UNTOLD = "dismiss"
LOOKS_AGAIN_SECONDS = 0.05


def answer_of(who: str) -> tuple[str, str]:
    """The word that says what to do, and what follows it."""
    try:
        text = (FOLDER / who).read_text().strip()
    except FileNotFoundError:
        text = ""
    word, _, rest = (text or UNTOLD).partition(" ")
    return word, rest


def record(who: str, question: dict) -> None:
    with (FOLDER / f"{who}.asked").open("a") as file:
        file.write(json.dumps(question) + "\n")
