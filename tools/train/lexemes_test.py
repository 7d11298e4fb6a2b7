"""Tests of the lexeme weight learning: the weights on small seeded synthetic counts, the
file written back, and (with PELMIX naming the CLI) the weights as the engine reads them."""
import json
import os
import shutil
import subprocess
import sys
import tempfile
import unittest

import numpy as np

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import lexemes as lx  # noqa: E402

ROOT = os.path.dirname(os.path.dirname(os.path.dirname(os.path.abspath(__file__))))

LEXDB = (
    "#8 3 4 3 64\n"
    "verify(2)account 40 0 1\n"
    "sign(1)in\t20 0 0\r\n"
    "paypal 50 101 0\n"
    "password   30 0 1\n"
    "konto 10\n"
    "\n"
    "trailing 99 0 0\n"
)


def synthetic_docs(seed=11):
    """Phishing and two legitimate classes; line 2 is a phishing sign, line 4 is as common
    everywhere, line 5 is common in hard ham only, line 3 appears nowhere."""
    rng = np.random.RandomState(seed)
    docs = []
    for label, n, rates in (("phishing", 400, {2: 0.6, 4: 0.3, 5: 0.05}),
                            ("ham", 300, {2: 0.02, 4: 0.3, 5: 0.05}),
                            ("ham-hard", 60, {2: 0.02, 4: 0.3, 5: 0.5})):
        for _ in range(n):
            docs.append((label, {ln for ln, r in rates.items() if rng.rand() < r}))
    return docs


class LexdbFileTest(unittest.TestCase):
    def test_read_finds_every_weight_before_the_end(self):
        with tempfile.TemporaryDirectory() as d:
            p = os.path.join(d, "lexdb.txt")
            with open(p, "w", newline="") as f:
                f.write(LEXDB)
            lines, weights = lx.read_lexdb(p)
        # The empty line ends the lexemes: "trailing" is not one for the engine.
        self.assertEqual(weights, {2: 40, 3: 20, 4: 50, 5: 30, 6: 10})
        self.assertEqual(lx.line_text(lines[2]), "sign(1)in")

    def test_write_changes_only_the_weights(self):
        with tempfile.TemporaryDirectory() as d:
            p = os.path.join(d, "lexdb.txt")
            with open(p, "w", newline="") as f:
                f.write(LEXDB)
            lines, weights = lx.read_lexdb(p)
            lx.write_lexdb(p, lines, weights)
            with open(p, newline="") as f:
                self.assertEqual(f.read(), LEXDB)
            lx.write_lexdb(p, lines, {2: 7, 3: 100, 5: 1, 6: 12})
            with open(p, newline="") as f:
                got = f.read()
        self.assertEqual(got, LEXDB.replace("account 40 0 1", "account 7 0 1")
                         .replace("in\t20 0 0\r\n", "in\t100 0 0\r\n")
                         .replace("password   30", "password   1")
                         .replace("konto 10", "konto 12"))


class LearnTest(unittest.TestCase):
    CURATED = {2: 30, 3: 35, 4: 40, 5: 30}

    def test_weights_follow_the_evidence(self):
        totals, counts = lx.document_counts(synthetic_docs())
        w = lx.learn_weights(self.CURATED, [(totals, counts)])
        self.assertGreaterEqual(w[2], 60)  # 30 times more frequent in phishing: far up
        self.assertEqual(w[3], 35)  # never seen: the curated weight stays
        self.assertLess(w[4], 40)  # as frequent everywhere: towards the neutral weight
        self.assertGreater(w[4], 25)
        self.assertLess(w[5], 15)  # frequent in hard ham: low, though rare in ham
        for v in w.values():
            self.assertTrue(lx.MIN_WEIGHT <= v <= lx.MAX_WEIGHT)

    def test_little_evidence_stays_near_the_curated_weight(self):
        docs = synthetic_docs()
        few = lx.document_counts(docs[::20])
        many = lx.document_counts(docs)
        w_few = lx.learn_weights(self.CURATED, [few])
        w_many = lx.learn_weights(self.CURATED, [many])
        self.assertLess(abs(w_few[2] - 30), abs(w_many[2] - 30))

    def test_channels_pool_by_evidence(self):
        docs = synthetic_docs()
        one = lx.document_counts(docs)
        # A channel with no phishing adds nothing, and the same channel twice is the same
        # ratio with twice the evidence (so at least as far from the prior).
        legit_only = lx.document_counts([d for d in docs if d[0] != "phishing"])
        self.assertEqual(lx.learn_weights(self.CURATED, [one, legit_only]),
                         lx.learn_weights(self.CURATED, [one]))
        twice = lx.learn_weights(self.CURATED, [one, one])
        self.assertGreaterEqual(twice[2], lx.learn_weights(self.CURATED, [one])[2])

    def test_scale_round_trips(self):
        for w in range(lx.MIN_WEIGHT, lx.MAX_WEIGHT + 1):
            self.assertEqual(lx.ratio_to_weight(lx.weight_to_ratio(w)), w)


class TrainPartTest(unittest.TestCase):
    def test_only_train_documents_count(self):
        labels = {"mail/%04d.eml" % i: ("phishing" if i % 2 else "ham", "g%d" % i)
                  for i in range(200)}
        split = lx.pt.split_files(labels, 5)
        with tempfile.TemporaryDirectory() as d:
            hits = os.path.join(d, "hits.jsonl")
            with open(hits, "w") as f:
                for name in sorted(labels):
                    # Line 9 marks the held-out documents, line 3 the train ones.
                    ln = 3 if split[name] == "train" else 9
                    f.write(json.dumps({"file": os.path.join(d, name), "lines": [ln],
                                        "counts": [1]}) + "\n")
                f.write(json.dumps({"file": os.path.join(d, "mail/0001.eml"),
                                    "error": "cannot read"}) + "\n")
            docs = lx.train_documents(hits, labels, 5, os.path.join(d, ""))
        self.assertEqual(len(docs), sum(1 for p in split.values() if p == "train"))
        self.assertTrue(all(lines == {3} for _, lines in docs))


@unittest.skipUnless(os.environ.get("PELMIX"), "PELMIX names the CLI")
class EngineReadsTheWeightsTest(unittest.TestCase):
    def test_learned_weights_survive_kb_build(self):
        pelmix = os.environ["PELMIX"]
        with tempfile.TemporaryDirectory() as d:
            kb = os.path.join(d, "kb")
            shutil.copytree(os.path.join(ROOT, "examples", "kb"), kb)
            path = os.path.join(kb, "lexdb.txt")
            lines, curated = lx.read_lexdb(path)
            totals, counts = lx.document_counts(
                [(lab, {min(curated) + (i % len(curated)) for i in range(len(s))})
                 for lab, s in synthetic_docs()])
            learned = lx.learn_weights(curated, [(totals, counts)])
            self.assertNotEqual(learned, curated)
            lx.write_lexdb(path, lines, learned)
            packed = os.path.join(d, "out.kb")
            subprocess.run([pelmix, "kb", "build", kb, packed], check=True,
                           capture_output=True)
            for i, w in sorted(learned.items()):
                text = lx.line_text(lines[i - 1])
                if "(" in text:
                    continue  # phrases have no query; their heads are words of their own
                out = subprocess.run([pelmix, "kb", "query", packed, "lexeme", text],
                                     capture_output=True, text=True, check=True).stdout
                self.assertIn(" first=%d " % w, out, text)


if __name__ == "__main__":
    unittest.main()
