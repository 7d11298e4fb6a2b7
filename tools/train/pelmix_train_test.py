"""Tests of the trainer on small seeded synthetic data.

The round-trip test needs the CLI: set PELMIX to build/bin/pelmix (CTest does); without it
that test is skipped.
"""
import json
import os
import subprocess
import sys
import tempfile
import unittest

import numpy as np

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import pelmix_train as pt  # noqa: E402
import train as tr  # noqa: E402


def synthetic(n=400, d=6, seed=3):
    """Two classes differing in the first two features; the rest is noise or constant 0."""
    rng = np.random.RandomState(seed)
    y = rng.rand(n) < 0.4
    X = np.zeros((n, d), dtype=np.float32)
    X[:, 0] = np.where(y, rng.gamma(4, 2, n), rng.gamma(1, 1, n))
    X[:, 1] = np.where(y, rng.rand(n) < 0.8, rng.rand(n) < 0.1)
    X[:, 2] = rng.poisson(3, n)
    X[:, 3] = 0.0
    X[:, 4] = rng.rand(n) * 1000
    X[:, 5] = rng.randint(0, 2, n) * 0.5
    return X, y


class RulesTest(unittest.TestCase):
    def test_levels_ascending_positive_and_constant_dropped(self):
        X, _ = synthetic()
        rules = pt.fit_rules(X)
        self.assertEqual(rules[3], [])
        for levels in rules:
            self.assertTrue(all(lv > 0 for lv in levels))
            self.assertEqual(levels, sorted(set(levels)))
        self.assertEqual(rules[5], [0.5])  # a single positive value gives one level

    def test_encoding_cases(self):
        rules = [[2.0, 4.0], [], [1.0]]
        X = np.array([
            [1.0, 7.0, 0.5],    # inside the first step
            [3.0, 7.0, 1.0],    # splits between places 0 and 1; level itself
            [2.0, 0.0, 2.0],    # a tie goes to the lower step; above the last level
            [5.0, 0.0, -1.0],   # above the last level; negative
            [np.nan, 0, np.inf],
        ], dtype=np.float32)
        want = np.array([
            [0.5, 0.0, 0.5],
            [0.5, 0.5, 1.0],
            [1.0, 0.0, 1.0],
            [0.0, 1.0, 1.0],
            [0.0, 1.0, 1.0],
        ], dtype=np.float32)
        np.testing.assert_array_equal(pt.encode_rules(X, rules), want)

    def test_dyadic_levels_are_short_and_exact_in_float(self):
        for v in (0.1, 3.3333, 12345.678, 1e-7):
            d = pt.dyadic(v)
            self.assertEqual(float(np.float32(d)), d)
            self.assertLess(abs(d - v) / v, 1 / 256)
        with self.assertRaises(ValueError):
            pt.dyadic(0.0)


class ThresholdTest(unittest.TestCase):
    CASES = [
        # radii of the negatives, budget, how many may be flagged at most
        ([0.1, 0.2, 0.3, 0.4, np.inf], 0.2, 1),
        ([0.1, 0.2, 0.3, 0.4, np.inf], 0.0, 0),
        ([0.3] * 10, 0.15, 0),  # ties cannot be split: flag none of them
        ([np.inf] * 4, 0.01, 0),
    ]

    def test_budget_kept(self):
        for radii, budget, most in self.CASES:
            with self.subTest(radii=radii, budget=budget):
                t = pt.choose_threshold(radii, budget)
                flagged = sum(1 for r in radii if np.float32(r) <= np.float32(t))
                self.assertLessEqual(flagged, most)
                self.assertLessEqual(flagged / len(radii), budget + 1e-12)

    def test_threshold_is_tight(self):
        t = pt.choose_threshold([0.1, 0.2, 0.3, 0.4, 0.5], 0.4)
        self.assertLess(t, 0.3)
        self.assertGreater(t, 0.2999)


class SplitTest(unittest.TestCase):
    def test_groups_on_one_side_and_reproducible(self):
        rng = np.random.RandomState(1)
        groups = ["g%d" % rng.randint(0, 60) for _ in range(500)]
        labels = ["phishing" if int(g[1:]) % 3 == 0 else "ham" for g in groups]
        a = pt.group_split(groups, labels, seed=5)
        b = pt.group_split(groups, labels, seed=5)
        self.assertEqual(list(a), list(b))
        side = {}
        for g, p in zip(groups, a):
            self.assertEqual(side.setdefault(g, p), p)
        for p in ("train", "calib", "test"):
            self.assertIn(p, set(a))
        for lab in ("phishing", "ham"):
            self.assertEqual({p for p, l in zip(a, labels) if l == lab},
                             {"train", "calib", "test"})


class TrainTest(unittest.TestCase):
    def fit_synthetic(self, seed=7, fit_X=None, n=600):
        X, y = synthetic(n=n)
        labels = ["phishing" if v else ("ham-hard" if i % 4 == 0 else "ham")
                  for i, v in enumerate(y)]
        groups = ["m%d" % i for i in range(len(y))]
        trusted = np.zeros(len(y), dtype=bool)
        part = pt.group_split(groups, labels, seed=seed)
        return X, y, labels, part, tr.train("mail", X, labels, groups, trusted, part, seed,
                                            fit_X)

    def test_learns_the_signal_and_is_reproducible(self):
        X, y, labels, part, first = self.fit_synthetic()
        second = self.fit_synthetic()[4]
        self.assertEqual(pt.format_network(first[1], first[2]),
                         pt.format_network(second[1], second[2]))
        self.assertEqual(first[3:], second[3:])
        rules, W, b = first[:3]
        outs = pt.net_outputs(pt.encode_rules(X, rules), W, b)
        test = part == "test"
        auc = pt.roc_auc(outs[test, 0], y[test])
        self.assertGreater(auc, 0.9)
        # Feature 0 is larger in phishing: its top step must weigh more than its bottom one.
        n0 = len(rules[0])
        self.assertGreater(W[0][n0 - 1], W[0][0])
        self.assertGreater(first[5], 0.0)  # some phishing detected within the budgets

    def test_thresholds_keep_the_budgets_out_of_fold(self):
        X, y, labels, part, got = self.fit_synthetic(n=900)
        thr, loud = got[3], got[4]
        self.assertLessEqual(loud, thr)
        # Refit the folds as train() does and count the flagged negatives of each class.
        dev = (part == "train") | (part == "calib")
        groups = ["m%d" % i for i in range(len(y))]
        fold = tr.fold_of(groups, tr.CV_FOLDS, 7)
        oof = np.full(len(y), np.inf, dtype=np.float32)
        trusted = np.zeros(len(y), dtype=bool)
        for k in range(tr.CV_FOLDS):
            model = tr.fit(X, labels, dev & (fold != k), 7, pt.CHANNEL_QUANTILES["mail"])
            held = dev & (fold == k)
            oof[held] = tr.radii(X[held], model, trusted[held])
        lab = np.array(labels)
        for cls, (budget, _) in pt.BUDGETS["mail"].items():
            neg = dev & (lab == cls)
            flagged = int((oof[neg] <= np.float32(thr)).sum())
            self.assertLessEqual(flagged, int(budget * neg.sum() + 1e-9))

    def test_fit_vectors_replace_the_fitting_data(self):
        X, y = synthetic(n=600)
        # Feature 2 is a perfect sign in what the engine sees, absent from what is fitted on.
        X[:, 2] = np.where(y, 5.0, 0.0)
        fit_X = X.copy()
        fit_X[:, 2] = 0.0
        labels = ["phishing" if v else "ham" for v in y]
        groups = ["m%d" % i for i in range(len(y))]
        part = pt.group_split(groups, labels, seed=3)
        got = tr.train("mail", X, labels, groups, np.zeros(len(y), dtype=bool), part, 3, fit_X)
        self.assertEqual(got[0][2], [])  # never above 0 in the fitting data: dropped

    def test_sample_weights_balance_every_class(self):
        labels = ["phishing"] * 60 + ["ham"] * 30 + ["ham-hard"] * 10
        w = pt.sample_weights(labels)
        lab = np.array(labels)
        tot = {c: w[lab == c].sum() for c in ("phishing", "ham", "ham-hard")}
        self.assertAlmostEqual(tot["phishing"], tot["ham"] + tot["ham-hard"])
        self.assertAlmostEqual(tot["ham"], tot["ham-hard"])
        self.assertAlmostEqual(w.sum(), len(labels))

    def test_split_of_the_lists_alone(self):
        labels = {"f%03d" % i: ("phishing" if i % 3 else "ham", "g%d" % (i // 2))
                  for i in range(300)}
        whole = pt.split_files(labels, 4)
        again = pt.split_files(dict(reversed(list(labels.items()))), 4)
        self.assertEqual(whole, again)  # the order of the list does not matter
        self.assertEqual(set(whole.values()), {"train", "calib", "test"})

    def test_auc_and_interval(self):
        self.assertEqual(pt.roc_auc([0.1, 0.2, 0.8, 0.9], [0, 0, 1, 1]), 1.0)
        self.assertEqual(pt.roc_auc([0.5, 0.5], [0, 1]), 0.5)
        self.assertTrue(np.isnan(pt.roc_auc([0.1, 0.2], [1, 1])))
        s = np.array([0.1, 0.4, 0.35, 0.8])
        yy = np.array([0, 0, 1, 1])
        lo, hi = pt.bootstrap_ci(lambda i: pt.roc_auc(s[i], yy[i]), 4, reps=200)
        self.assertLessEqual(lo, 0.75)
        self.assertGreaterEqual(hi, 0.75)

    def test_cfg_lines_replaced_others_kept(self):
        with tempfile.TemporaryDirectory() as d:
            p = os.path.join(d, "v3.cfg")
            with open(p, "w") as f:
                f.write("dbstamp=20261206;\nweb_threshold=0.05;\nmail_threshold=0.05;\n")
            tr.set_cfg(p, {"mail_threshold": "0.2", "mail_threshold_loud": "0.1"})
            with open(p) as f:
                text = f.read()
            self.assertEqual(text, "dbstamp=20261206;\nweb_threshold=0.05;\n"
                             "mail_threshold=0.2;\nmail_threshold_loud=0.1;\n")


@unittest.skipUnless(os.environ.get("PELMIX"), "PELMIX names the CLI")
class RoundTripTest(unittest.TestCase):
    def test_engine_gives_the_trainers_outputs(self):
        X, y = synthetic(n=300, d=214, seed=9)
        X[:5, 7] = np.nan  # saturating and odd values travel too
        X[5:10, 8] = -3
        rules = pt.fit_rules(X)
        E = pt.encode_rules(X, rules)
        W, b = pt.fit_network(E, y)
        want = pt.net_outputs(E, W, b)
        with tempfile.TemporaryDirectory() as d:
            for name, text in (("web.rules", pt.format_rules(rules)),
                               ("web.net", pt.format_network(W, b)),
                               ("web.flow", pt.format_flow("web"))):
                with open(os.path.join(d, name), "w", newline="") as f:
                    f.write(text)
            feed = "".join(" ".join(repr(float(v)) for v in row) + "\n" for row in X)
            run = subprocess.run([os.environ["PELMIX"], "model", "run", "--dir", d,
                                  "web.flow", "--threshold", "0.3"],
                                 input=feed, capture_output=True, text=True, check=True)
        got = [[float(v) for v in line.split("\t")[0].split()]
               for line in run.stdout.splitlines()]
        detected = [line.split("\t")[1] == "1" for line in run.stdout.splitlines()]
        got = np.array(got, dtype=np.float32)
        self.assertEqual(got.shape, want.shape)
        np.testing.assert_allclose(got, want, rtol=2e-7, atol=1e-12)
        self.assertEqual(detected, list(pt.radius(want) <= np.float32(0.3)))
        self.assertGreater(sum(detected), 0)


if __name__ == "__main__":
    unittest.main()
