"""Reads our policy file as strictly as polkit does not, and says what is wrong in it."""

import xml.etree.ElementTree as ElementTree

ACTION = "org.vlm.vlmbind.admin"
VENDOR = "vlmbind"
DEFAULTS = {"allow_any": "no", "allow_inactive": "no", "allow_active": "auth_admin_keep"}
LANGUAGES = {None, "de", "fr", "es", "it", "pt_BR", "ja", "zh_CN", "ar"}
LANGUAGE = "{http://www.w3.org/XML/1998/namespace}lang"


def unknown_parts(element: ElementTree.Element, known: set[str]) -> list[str]:
    problems = [f"<{each.tag}> in <{element.tag}>" for each in element if each.tag not in known]
    if (element.text or "").strip() or any((each.tail or "").strip() for each in element):
        problems.append(f"text in <{element.tag}>")
    return problems


def text_problems(action: ElementTree.Element, tag: str) -> list[str]:
    problems = []
    texts: dict[str | None, str] = {}
    for element in action.findall(tag):
        language = element.get(LANGUAGE)
        if language in texts:
            problems.append(f"two <{tag}> in {language}")
        if set(element.attrib) - {LANGUAGE} or len(element):
            problems.append(f"<{tag}> in {language} holds more than text")
        texts[language] = element.text or ""
    problems += [f"no <{tag}> in {each}" for each in LANGUAGES - set(texts)]
    problems += [
        f"<{tag}> in {each}, which is no language of ours" for each in set(texts) - LANGUAGES
    ]
    for language, text in texts.items():
        if not text or text != text.strip() or "$" in text:
            problems.append(f"<{tag}> in {language}: {text!r}")
        if language and text == texts.get(None):
            problems.append(f"<{tag}> in {language} is not translated")
    return problems


def defaults_problems(defaults: ElementTree.Element) -> list[str]:
    problems = unknown_parts(defaults, set(DEFAULTS))
    for tag, wanted in DEFAULTS.items():
        values = [each.text for each in defaults.findall(tag)]
        if values != [wanted]:
            problems.append(f"{tag} is {values}, and not {wanted}")
    return problems


def action_problems(action: ElementTree.Element) -> list[str]:
    problems = unknown_parts(action, {"description", "message", "defaults"})
    if action.attrib != {"id": ACTION}:
        problems.append(f"the action is {action.attrib}")
    for tag in ("description", "message"):
        problems += text_problems(action, tag)
    defaults = action.findall("defaults")
    if len(defaults) != 1:
        return problems + [f"{len(defaults)} <defaults>"]
    return problems + defaults_problems(defaults[0])


def problems_of(document: bytes) -> list[str]:
    try:
        root = ElementTree.fromstring(document)
    except ElementTree.ParseError as error:
        return [f"no XML: {error}"]
    if root.tag != "policyconfig":
        return [f"the document is a <{root.tag}>"]
    problems = unknown_parts(root, {"vendor", "icon_name", "action"})
    if root.findtext("vendor") != VENDOR:
        problems.append(f"the vendor is {root.findtext('vendor')}")
    actions = root.findall("action")
    if len(actions) != 1:
        return problems + [f"{len(actions)} actions"]
    return problems + action_problems(actions[0])
