"""pelmix-milter driven by a real milter client (miltertest and the Lua scripts beside this
file). Every test starts its own milter on a unix socket in a temporary directory and stops
it with SIGTERM, which must end it with status 0."""

import os
import re
import shutil
import signal
import subprocess
import tempfile
import threading
import time
import unittest

MILTER = os.environ["PELMIX_MILTER"]
CLI = os.environ["PELMIX_CLI"]
KB = os.environ["PELMIX_DEFAULT_KB"]
EXAMPLE_KB = os.environ["PELMIX_EXAMPLE_KB"]
SOURCE = os.environ["PELMIX_SOURCE_DIR"]
HERE = os.path.dirname(os.path.abspath(__file__))
CLEAN = os.path.join(SOURCE, "examples", "clean-mail.eml")
PHISHING = os.path.join(SOURCE, "examples", "phishing-mail.eml")


def cli_verdict(path, kb=KB):
    """The X-Pelmix-Verdict that `pelmix mail` implies for a file."""
    out = subprocess.run([CLI, "mail", "--kb", kb, path], capture_output=True, text=True).stdout
    line = out.strip().split("\n")[-1]
    m = re.match(r".*: PHISHING weight=(\S+) target=(.*)$", line)
    if m:
        return "phishing; weight=%s; target=%s" % (m.group(1), m.group(2))
    if line.endswith(": clean"):
        return "clean"
    raise AssertionError("pelmix mail gave no verdict for %s: %r" % (path, out))


class Milter:
    """A pelmix-milter on a unix socket in its own temporary directory."""

    def __init__(self, *args, kb=KB):
        self.dir = tempfile.mkdtemp(prefix="pelmix-milter-")
        self.socket = os.path.join(self.dir, "milter.sock")
        self.log_path = os.path.join(self.dir, "log")
        self.log = open(self.log_path, "w")
        self.last_log = ""
        self.proc = subprocess.Popen(
            [MILTER, "--kb", kb, "--socket", "unix:" + self.socket, *args],
            stdout=subprocess.DEVNULL, stderr=self.log)
        deadline = time.time() + 30
        while not os.path.exists(self.socket):
            if self.proc.poll() is not None or time.time() > deadline:
                self.log.close()
                raise AssertionError("the milter did not start: " + self.text())
            time.sleep(0.05)

    def text(self):
        """The milter's log so far (kept after the directory is gone)."""
        if os.path.exists(self.log_path):
            with open(self.log_path) as f:
                self.last_log = f.read()
        return self.last_log

    def run(self, script, timeout=300, **env):
        """Runs a Lua script against this milter; returns (status, output)."""
        full = dict(os.environ, MILTER_LUA_DIR=HERE, MILTER_SOCKET="unix:" + self.socket)
        full.update({k: str(v) for k, v in env.items()})
        done = subprocess.run(["miltertest", "-s", os.path.join(HERE, script)], env=full,
                              capture_output=True, text=True, timeout=timeout)
        return done.returncode, done.stdout + done.stderr

    def stop(self):
        """SIGTERM; returns the exit status."""
        if self.proc.poll() is None:
            self.proc.send_signal(signal.SIGTERM)
        try:
            return self.proc.wait(timeout=30)
        finally:
            self.log.close()

    def __enter__(self):
        return self

    def __exit__(self, *exc):
        if self.proc.poll() is None:
            self.proc.kill()
            self.proc.wait()
        self.log.close()
        self.text()
        shutil.rmtree(self.dir, ignore_errors=True)


class MilterTest(unittest.TestCase):
    def assertRuns(self, milter, script, **env):
        status, output = milter.run(script, **env)
        self.assertEqual(status, 0, output + "\nmilter log:\n" + milter.text())
        return output

    def assertStops(self, milter):
        self.assertEqual(milter.stop(), 0, milter.text())

    def cases_file(self, directory, files, repeat=1):
        path = os.path.join(directory, "cases")
        with open(path, "w") as f:
            for _ in range(repeat):
                for file, want in files:
                    f.write("%s\t%s\n" % (file, want))
        return path

    def test_each_action_agrees_with_pelmix_mail(self):
        files = sorted(os.path.join(SOURCE, "examples", n)
                       for n in os.listdir(os.path.join(SOURCE, "examples")) if n.endswith(".eml"))
        data = os.path.join(SOURCE, "tests", "data", "mail")
        files += sorted(os.path.join(data, n) for n in os.listdir(data) if n.endswith(".eml"))
        cases = [(f, cli_verdict(f)) for f in files]
        wants = [w for _, w in cases]
        self.assertIn("clean", wants)
        self.assertTrue(any(w.startswith("phishing;") for w in wants), wants)
        for action in ("tag", "reject", "quarantine"):
            with self.subTest(action=action), Milter("--action", action) as milter:
                output = self.assertRuns(milter, "verdicts.lua", MILTER_ACTION=action,
                                         MILTER_CASES=self.cases_file(milter.dir, cases))
                self.assertEqual(output.count("ok "), len(cases), output)
                self.assertStops(milter)

    def test_a_senders_own_verdict_header_is_removed(self):
        want = cli_verdict(PHISHING)
        self.assertTrue(want.startswith("phishing;"))
        with Milter() as milter:
            self.assertRuns(milter, "one.lua", MILTER_FILE=PHISHING, MILTER_EXTRA="forged",
                            MILTER_REPLY="accept", MILTER_WANT=want)
            self.assertStops(milter)

    def test_a_message_over_max_message(self):
        size = os.path.getsize(PHISHING) + 64
        with Milter("--max-message", str(size)) as milter:
            # A clean start says nothing about the rest: unchecked, never "clean".
            self.assertRuns(milter, "one.lua", MILTER_FILE=CLEAN, MILTER_PADDING=size * 4,
                            MILTER_REPLY="accept", MILTER_WANT="unchecked; reason=too-large")
            # Within the limit it is judged as usual.
            self.assertRuns(milter, "one.lua", MILTER_FILE=CLEAN, MILTER_REPLY="accept",
                            MILTER_WANT="clean")
            # Phishing found in the part that was judged stands (the judged part holds the
            # whole message and 64 bytes of the padding, which move the weight a little).
            self.assertRuns(milter, "one.lua", MILTER_FILE=PHISHING, MILTER_PADDING=size * 4,
                            MILTER_REPLY="accept", MILTER_WANT="phishing; weight=",
                            MILTER_WANT_PREFIX=1)
            self.assertStops(milter)
        self.assertIn("larger than max-message", milter.text())

    @unittest.skipIf(os.environ.get("PELMIX_SANITIZED"), "sanitizers inflate memory")
    def test_memory_stays_bounded_for_a_huge_message(self):
        with Milter("--max-message", str(1 << 20)) as milter:
            self.assertRuns(milter, "one.lua", MILTER_FILE=CLEAN, MILTER_REPLY="accept",
                            MILTER_WANT="clean")
            before = peak_rss_kb(milter.proc.pid)
            self.assertRuns(milter, "one.lua", MILTER_FILE=CLEAN, MILTER_PADDING=64 << 20,
                            MILTER_REPLY="accept", MILTER_WANT="unchecked; reason=too-large")
            grown = peak_rss_kb(milter.proc.pid) - before
            # 64 MB went through; one megabyte of it is kept, and the walk of it costs a few.
            self.assertLess(grown, 24 << 10, "peak memory grew by %d KB" % grown)
            self.assertStops(milter)

    def test_a_message_that_cannot_be_judged(self):
        with Milter() as milter:
            self.assertRuns(milter, "one.lua", MILTER_FILE=CLEAN, MILTER_EXTRA="bad",
                            MILTER_REPLY="accept", MILTER_WANT="unchecked; reason=unreadable")
            self.assertStops(milter)
        self.assertIn("not judged: unreadable message", milter.text())
        with Milter("--on-error", "tempfail") as milter:
            self.assertRuns(milter, "one.lua", MILTER_FILE=CLEAN, MILTER_EXTRA="bad",
                            MILTER_REPLY="tempfail")
            # Only the messages that could not be judged are refused.
            self.assertRuns(milter, "one.lua", MILTER_FILE=CLEAN, MILTER_REPLY="accept",
                            MILTER_WANT="clean")
            self.assertStops(milter)

    def test_connections_beyond_the_limit_wait(self):
        with Milter("--max-connections", "1") as milter:
            self.assertRuns(milter, "limit.lua")
            self.assertStops(milter)
        self.assertIn("refused a connection", milter.text())

    def test_reload_while_messages_flow(self):
        work = tempfile.mkdtemp(prefix="pelmix-milter-kb-")
        try:
            kb = os.path.join(work, "current.kb")
            shutil.copyfile(KB, kb)
            broken = os.path.join(work, "broken")
            with open(broken, "wb") as f:
                f.write(b"this is no knowledge base\n" * 100)
            cases = [(CLEAN, cli_verdict(CLEAN)), (PHISHING, cli_verdict(PHISHING))]
            with Milter(kb=kb) as milter:
                stop = threading.Event()
                sent = [0]

                def reloads():
                    # Good and broken files in turn, each swapped in atomically; a broken
                    # one must leave the good service serving.
                    while not stop.is_set():
                        source = KB if sent[0] % 2 == 0 else broken
                        shutil.copyfile(source, kb + ".new")
                        os.replace(kb + ".new", kb)
                        milter.proc.send_signal(signal.SIGHUP)
                        sent[0] += 1
                        time.sleep(0.02)

                thread = threading.Thread(target=reloads)
                thread.start()
                try:
                    output = self.assertRuns(milter, "verdicts.lua", MILTER_ACTION="tag",
                                             MILTER_CASES=self.cases_file(milter.dir, cases, 300))
                finally:
                    stop.set()
                    thread.join()
                self.assertEqual(output.count("ok "), 600)
                self.assertGreaterEqual(sent[0], 10)
                self.assertIsNone(milter.proc.poll(), "SIGHUP stopped the milter")
                # Signals sent faster than reloads end are merged: wait for the last reload.
                # Which files those reloads found depends on timing, so the broken one is
                # swapped in once more on its own.
                quiet(milter)
                failure = "reload failed, still serving the previous knowledge base"
                failed = milter.text().count(failure)
                shutil.copyfile(broken, kb + ".new")
                os.replace(kb + ".new", kb)
                milter.proc.send_signal(signal.SIGHUP)
                wait_for(lambda: milter.text().count(failure) > failed, milter.text)
                self.assertRuns(milter, "one.lua", MILTER_FILE=PHISHING, MILTER_REPLY="accept",
                                MILTER_WANT=cases[1][1])
                log = milter.text()

                # A different knowledge base that loads is swapped in: the example one judges
                # the example phishing mail otherwise.
                changed = cli_verdict(PHISHING, EXAMPLE_KB)
                self.assertNotEqual(changed, cases[1][1])
                reloaded = log.count("reloaded ")
                shutil.copyfile(EXAMPLE_KB, kb + ".new")
                os.replace(kb + ".new", kb)
                milter.proc.send_signal(signal.SIGHUP)
                wait_for(lambda: milter.text().count("reloaded ") > reloaded, milter.text)
                self.assertRuns(milter, "one.lua", MILTER_FILE=PHISHING, MILTER_REPLY="accept",
                                MILTER_WANT=changed)
                self.assertStops(milter)
        finally:
            shutil.rmtree(work, ignore_errors=True)

    def test_startup_errors(self):
        def status(*args):
            return subprocess.run([MILTER, *args], capture_output=True, timeout=60).returncode

        self.assertEqual(status("--action", "drop"), 64)
        self.assertEqual(status("--max-message", "0"), 64)
        self.assertEqual(status("--socket", "inet:8640"), 64)
        self.assertEqual(status("--kb", "/nonexistent/pelmix.kb", "--socket",
                                "unix:/nonexistent/dir/sock"), 2)
        self.assertEqual(status("--kb", KB, "--socket", "unix:/nonexistent/dir/sock"), 2)
        usage = subprocess.run([MILTER, "--help"], capture_output=True, text=True)
        self.assertEqual(usage.returncode, 0)
        self.assertIn("inet:8640@127.0.0.1", usage.stdout)


def peak_rss_kb(pid):
    with open("/proc/%d/status" % pid) as f:
        for line in f:
            if line.startswith("VmHWM:"):
                return int(line.split()[1])
    raise AssertionError("no VmHWM for %d" % pid)


def quiet(milter, seconds=1.0):
    """Waits until the milter's log has not grown for `seconds`."""
    deadline = time.time() + 60
    last, since = milter.text(), time.time()
    while time.time() - since < seconds:
        if time.time() > deadline:
            raise AssertionError("the log keeps growing:\n" + last)
        time.sleep(0.1)
        now = milter.text()
        if now != last:
            last, since = now, time.time()


def wait_for(condition, describe, seconds=30):
    deadline = time.time() + seconds
    while not condition():
        if time.time() > deadline:
            raise AssertionError("timed out; log:\n" + describe())
        time.sleep(0.05)


if __name__ == "__main__":
    unittest.main()
