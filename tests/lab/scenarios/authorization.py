"""The right to pair is an administrator's, for whoever sits at the machine."""

from machine.checks import check

ACTION = "org.vlm.vlmbind.admin"
ASK = "vlm-ask-for-right"
GRANTED = "0\n"
DENIED = "-60005\n"
CANCELED = "-60006\n"
FAILED = "-60008\n"
ANSWER = "/run/vlm-lab/right"


def an_administrators_password_grants_the_right(lab):
    lab.answer("polkit", "password pw-carol")

    check.assertEqual(lab.user("alice", ASK).output, GRANTED)

    (question,) = lab.asked("polkit")
    check.assertEqual(question["action"], ACTION)
    check.assertEqual(question["users"], ["carol"])
    check.assertEqual(
        question["message"], "Authentication is required to pair a smart card with your account"
    )


def a_question_that_is_dismissed_is_told_from_a_wrong_answer(lab):
    lab.answer("polkit", "dismiss")
    check.assertEqual(lab.user("alice", ASK).output, CANCELED)

    lab.answer("polkit", "fail")
    check.assertEqual(lab.user("alice", ASK).output, DENIED)


def an_agent_that_dies_grants_nothing(lab):
    lab.answer("polkit", "die")

    check.assertEqual(lab.user("alice", ASK).output, DENIED)


def the_right_is_kept_for_the_process_alone(lab):
    lab.answer("polkit", "password pw-carol")

    check.assertEqual(lab.user("alice", ASK, typed="again\nagain\n").output, GRANTED * 3)
    check.assertEqual(len(lab.asked("polkit")), 1)

    lab.answer("polkit", "dismiss")
    check.assertEqual(lab.user("alice", ASK).output, CANCELED)


def nobody_is_asked_for_who_comes_from_afar(lab):
    lab.answer("polkit", "password pw-carol")

    check.assertEqual(lab.user("bob", ASK).output, DENIED)

    check.assertEqual(lab.asked("polkit"), [])


def polkit_may_end_while_the_question_is_open(lab):
    _leave_the_question_open(lab)

    lab.root("systemctl", "kill", "--signal=KILL", "polkit.service")

    lab.wait_until("the answer is there", lambda: lab.root("cat", ANSWER).output == FAILED)


def the_question_goes_with_whoever_asks(lab):
    _leave_the_question_open(lab)

    lab.user("alice", "systemctl", "--user", "kill", "--signal=KILL", "asking.service")

    lab.wait_until("it is taken back", lambda: {"cancelled": True} in lab.asked("polkit"))


def _leave_the_question_open(lab) -> None:
    lab.answer("polkit", "wait")
    lab.root("install", "-o", "alice", "/dev/null", ANSWER)
    # fmt: off
    started = lab.user(
        "alice", "systemd-run", "--user", "--quiet", "--unit=asking", "--collect",
        f"--property=StandardOutput=append:{ANSWER}", ASK,
    )
    # fmt: on
    check.assertEqual(started.status, 0, started)
    lab.wait_until("the question is there", lambda: lab.asked("polkit"))
