"""webapi-account from the outside: commands, exit statuses, password input."""

import json
import os
import re
import signal
import sys
import termios
import time
import unittest

from account_program import ACCOUNTS, FAILURE, MODULES, SUCCESS, ProgramTest, Terminal


class AccountProgram(ProgramTest):
    def accounts(self):
        return {entry["name"]: entry for entry in json.loads(self.done("list", "--json"))}

    def stored(self, name):
        for line in ACCOUNTS.read_text().splitlines():
            if json.loads(line)["name"] == name:
                return json.loads(line)
        return None

    def test_help_goes_to_standard_output(self):
        text = self.done("--help")
        for command in ("add", "passwd", "remove", "list", "lock", "unlock", "groups", "grant",
                        "revoke", "rotate-key", "--generate", "--admin", "--network", "--json"):
            self.assertIn(command, text)
        self.assertEqual(text, self.done("add", "--help"))
        self.assertFalse(ACCOUNTS.exists())

    def test_wrong_usage_shows_the_usage(self):
        for words in ((), ("fly",), ("add",), ("add", "anna", "secret"), ("list", "anna"),
                      ("remove",), ("remove", "anna", "bob"), ("grant", "anna"),
                      ("grant", "anna", "a", "b"), ("revoke", "anna"), ("lock",), ("--json",),
                      ("list", "--admin"), ("lock", "anna", "--generate"),
                      ("add", "anna", "--password", "x"), ("add", "anna", "--network", "::/0"),
                      ("grant", "anna", "a", "--network"), ("grant", "anna", "a", "--network", ""),
                      ("groups", "anna", "staff", "--none"), ("passwd", "anna", "--expires", "x"),
                      ("passwd", "anna", "--expires", "-1"), ("passwd", "anna", "--expires", "")):
            self.misused(*words)
        self.assertFalse(ACCOUNTS.exists())

    def test_add_reads_one_line_from_a_pipe(self):
        self.assertEqual("", self.done("add", "anna", typed="secret\nnot this\n"))
        self.assertEqual(0o600, ACCOUNTS.stat().st_mode & 0o777)
        self.assertRegex(self.stored("anna")["password"], r"^\$y\$")
        self.assertNotIn("secret", ACCOUNTS.read_text())
        account = self.accounts()["anna"]
        self.assertEqual({"name": "anna", "uid": 1024, "locked": False, "passwordExpires": 0,
                          "groups": [], "privileges": {}}, account)

    def test_add_takes_a_last_line_without_its_end(self):
        self.done("add", "anna", typed="secret")
        self.assertIn("anna", self.accounts())

    def test_add_refuses_what_cannot_be(self):
        self.done("add", "anna", typed="secret\n")
        self.assertIn("exists", self.refused("add", "anna", typed="other\n"))
        for password in ("", "\n", "a\0b\n", "x" * 512 + "\n", "x" * 100000 + "\n"):
            self.refused("add", "bob", typed=password)
        for name in ("", "a/b", "..", "a b", "a\nb", "x" * 65, "\u00e4"):
            self.refused("add", name, typed="secret\n")

    def test_add_makes_an_administrator(self):
        self.done("add", "anna", "--admin", typed="secret\n")
        self.assertEqual(["administrators"], self.accounts()["anna"]["groups"])

    def test_generate_prints_a_password_that_differs_each_time(self):
        made = {self.done("add", "anna", "--generate"), self.done("passwd", "anna", "--generate"),
                self.done("--generate", "add", "bob")}
        self.assertEqual(3, len(made))
        for password in made:
            self.assertRegex(password, r"^[A-Za-z0-9]{20}\n$")

    def test_generate_shows_no_password_that_does_not_count(self):
        self.done("add", "anna", "--generate")
        self.refused("add", "anna", "--generate")
        self.refused("passwd", "bob", "--generate")

    def test_passwd_sets_another_password_and_its_end(self):
        self.done("add", "anna", typed="secret\n")
        first = self.stored("anna")["password"]
        self.done("passwd", "anna", "--expires", "10", typed="other\n")
        self.assertNotEqual(first, self.stored("anna")["password"])
        self.assertAlmostEqual(time.time() + 864000, self.accounts()["anna"]["passwordExpires"],
                               delta=300)
        self.done("passwd", "anna", "--expires", "0", typed="other\n")
        self.assertAlmostEqual(time.time(), self.accounts()["anna"]["passwordExpires"], delta=300)
        self.done("passwd", "anna", typed="other\n")
        self.assertEqual(0, self.accounts()["anna"]["passwordExpires"])

    def test_lock_unlock_and_remove(self):
        self.done("add", "anna", "--generate")
        self.done("lock", "anna")
        self.assertTrue(self.accounts()["anna"]["locked"])
        self.done("unlock", "anna")
        self.assertFalse(self.accounts()["anna"]["locked"])
        self.done("remove", "anna")
        self.assertEqual({}, self.accounts())
        for command in ("lock", "unlock", "remove", "groups"):
            self.assertIn('there is no account "anna"', self.refused(command, "anna"))

    def test_groups_are_set_printed_and_emptied(self):
        self.done("add", "anna", "--generate")
        self.done("groups", "anna", "staff", "administrators")
        self.assertEqual("staff\nadministrators\n", self.done("groups", "anna"))
        self.refused("groups", "anna", "a/b")
        self.done("groups", "anna", "--none")
        self.assertEqual("", self.done("groups", "anna"))

    def test_privileges_are_granted_with_networks_and_revoked(self):
        self.done("add", "anna", "--generate")
        self.done("grant", "anna", "Acme.Light", "--network", "10.0.0.0/8")
        self.done("grant", "anna", "Acme.Light", "--network", "fd00::/8")
        self.done("grant", "anna", "Acme.Door")
        self.assertEqual({"Acme.Light": ["10.0.0.0/8", "fd00::/8"], "Acme.Door": []},
                         self.accounts()["anna"]["privileges"])
        self.done("revoke", "anna", "Acme.Light")
        self.assertEqual({"Acme.Door": []}, self.accounts()["anna"]["privileges"])
        self.refused("revoke", "anna", "Acme.Light")
        self.refused("grant", "anna", "Acme.Light", "--network", "10.0.0.0/33")

    def test_list_is_a_table_with_a_heading(self):
        self.assertRegex(self.done("list"), r"^NAME +UID +STATE +EXPIRES +GROUPS +PRIVILEGES\n$")
        self.done("add", "bob", "--generate")
        self.done("add", "anna", "--admin", "--generate")
        self.done("lock", "bob")
        self.done("grant", "bob", "Acme.Light", "--network", "10.0.0.0/8")
        _, anna, bob = self.done("list").splitlines()
        self.assertEqual(["anna", "1025", "open", "never", "administrators", "-"], anna.split())
        self.assertEqual(["bob", "1024", "locked", "never", "-", "Acme.Light@10.0.0.0/8"],
                         bob.split())

    def test_list_never_shows_a_hash(self):
        self.done("add", "anna", "--generate")
        for words in (("list",), ("list", "--json")):
            self.assertNotIn("$y$", self.done(*words))

    def test_broken_lines_stay_and_a_writable_file_is_refused(self):
        ACCOUNTS.parent.mkdir(parents=True)
        broken = b"not json \xff\0 at all\r\n\n"
        ACCOUNTS.write_bytes(broken)
        ACCOUNTS.chmod(0o600)
        self.done("add", "anna", "--generate")
        self.done("lock", "anna")
        self.assertTrue(ACCOUNTS.read_bytes().startswith(broken))
        self.assertEqual(["anna"], list(self.accounts()))
        ACCOUNTS.chmod(0o620)
        self.refused("lock", "anna")
        self.refused("list")

    def test_system_accounts_are_listed_but_not_changed(self):
        ACCOUNTS.parent.mkdir(parents=True)
        (ACCOUNTS.parent / "host.conf").write_text('accounts="system"\n')
        self.assertIn("administrators", self.accounts()["root"]["groups"])
        self.assertIn("read only", self.refused("add", "anna", "--generate"))
        self.assertIn("read only", self.refused("lock", "root"))

    def test_missing_module_is_told(self):
        (MODULES / "talo-password.so").unlink()
        self.assertIn("cannot be hashed", self.refused("add", "anna", typed="secret\n"))
        self.assertEqual({}, self.accounts())

    def test_terminal_asks_twice_and_shows_nothing(self):
        terminal = Terminal("add", "anna")
        terminal.wait_for(b"New password: ")
        terminal.type(b"secret\n")
        terminal.wait_for(b"Again: ")
        terminal.type(b"secret\n")
        shown, status = terminal.end()
        self.assertEqual(SUCCESS, status)
        self.assertNotIn(b"secret", shown)
        self.assertIn("anna", self.accounts())

    def test_terminal_refuses_two_passwords_that_differ(self):
        terminal = Terminal("add", "anna")
        terminal.wait_for(b"New password: ")
        terminal.type(b"secret\n")
        terminal.wait_for(b"Again: ")
        terminal.type(b"secreT\n")
        shown, status = terminal.end()
        self.assertEqual(FAILURE, status)
        self.assertIn(b"the two passwords differ", shown)
        self.assertFalse(re.search(rb"secre[tT]", shown))
        self.assertFalse(ACCOUNTS.exists())

    def test_terminal_shows_typing_again_after_an_interrupt(self):
        terminal = Terminal("add", "anna")
        terminal.wait_for(b"New password: ")
        self.assertFalse(termios.tcgetattr(terminal.screen)[3] & termios.ECHO)
        terminal.type(b"\x03")
        _, status = os.waitpid(terminal.child, 0)
        self.assertEqual(-signal.SIGINT, os.waitstatus_to_exitcode(status))
        self.assertTrue(termios.tcgetattr(terminal.screen)[3] & termios.ECHO)
        os.close(terminal.screen)


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1])
