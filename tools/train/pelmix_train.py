"""Trains pelmix's decision models from labelled feature vectors.

The vectors are the JSON lines of `pelmix scan --json --features` (web, 214 values) and
`pelmix mail --json --features` (mail, 260 values). The model is a per-feature rules encoding
(levels at quantiles of the training values) into a one-layer logistic network with two
sigmoid outputs, both trained towards the label, so the decision step's distance to (1, 1)
works as a confidence radius. Everything here mirrors the engine's arithmetic so the outputs
computed here are the outputs the engine computes, to float precision.
"""
import json
import math

import numpy as np

SEED = 16
# Quantiles of a feature's positive training values that become its rules levels; the top
# level is the largest value seen, so values above it saturate in the last place.
LEVEL_QUANTILES = (0.25, 0.5, 0.75, 0.9, 0.99, 1.0)
# Per channel, chosen by cross-validation on the train and calibration parts: mail has
# thousands of samples and gains from finer steps (recall at the budgets 0.57 -> 0.72); the
# web's few phishing pages do not (0.35 -> 0.31).
CHANNEL_QUANTILES = {
    "mail": (0.1, 0.2, 0.3, 0.4, 0.5, 0.6, 0.7, 0.8, 0.9, 0.95, 0.99, 1.0),
    "web": LEVEL_QUANTILES,
}
# Regularisation strengths (inverse, scikit-learn's C) of the two outputs: two differently
# regularised views of the same encoding, so their agreement is a confidence.
OUTPUT_C = (1.0, 0.3)
# Share of the groups held out for choosing thresholds, and for measuring.
CALIBRATION_SHARE = 0.2
TEST_SHARE = 0.2
VECTOR_SIZE = {"web": 214, "mail": 260}
# False-positive budgets per negative class: (quiet detection radius, loud radius).
BUDGETS = {
    "web": {"legit": (0.01, 0.001)},
    "mail": {"ham-hard": (0.01, 0.001), "ham": (0.001, 0.0001)},
}


def load_vectors(jsonl_path, labels, prefix=""):
    """Reads the CLI's JSON lines; labels maps file name -> (label, group).

    Returns (X float32 [n, d], label list, group list, file list, trusted list): a record
    without features (a trusted page) gets zeros and trusted=True, the engine never
    flags it.
    """
    rows, lab, grp, files, trusted = [], [], [], [], []
    size = None
    with open(jsonl_path, encoding="utf-8") as f:
        for line in f:
            rec = json.loads(line)
            name = rec.get("file", "")
            key = name[len(prefix):] if prefix and name.startswith(prefix) else name
            if key not in labels and key.endswith("#1"):
                key = key[:-2]  # a message starting with "From " is read as an mbox of one
            if key not in labels or "error" in rec:
                continue
            feats = rec.get("features")
            if feats is not None:
                size = len(feats)
            rows.append(feats)
            lab.append(labels[key][0])
            grp.append(labels[key][1])
            files.append(key)
            trusted.append(feats is None)
    if size is None:
        raise ValueError("no feature vectors in " + jsonl_path)
    X = np.zeros((len(rows), size), dtype=np.float32)
    for i, r in enumerate(rows):
        if r is not None:
            if len(r) != size:
                raise ValueError("vectors of different sizes in " + jsonl_path)
            X[i] = np.asarray(r, dtype=np.float64).astype(np.float32)
    return X, lab, grp, files, np.asarray(trusted)


def dyadic(v, bits=8):
    """v rounded to `bits` significant bits: exact in float, double and a short decimal."""
    if v <= 0 or not math.isfinite(v):
        raise ValueError("level must be finite and above 0")
    m, e = math.frexp(v)
    return math.ldexp(round(m * (1 << bits)) / (1 << bits), e)


def fit_rules(X, quantiles=LEVEL_QUANTILES):
    """Per feature, ascending levels > 0 (or [] to drop a feature never above 0)."""
    rules = []
    for j in range(X.shape[1]):
        v = X[:, j].astype(np.float64)
        pos = v[np.isfinite(v) & (v > 0)]
        if pos.size == 0:
            rules.append([])
            continue
        levels = []
        for q in quantiles:
            lv = dyadic(float(np.quantile(pos, q)))
            if not levels or lv > levels[-1]:
                levels.append(lv)
        rules.append(levels)
    return rules


def encode_rules(X, rules):
    """The engine's rules conversion: double arithmetic, stored as float."""
    n = X.shape[0]
    width = sum(len(r) for r in rules)
    out = np.zeros((n, width), dtype=np.float32)
    col = 0
    for j, levels in enumerate(rules):
        k = len(levels)
        if k == 0:
            continue
        x = X[:, j].astype(np.float64)
        done = np.zeros(n, dtype=bool)
        prev = 0.0
        for i, lv in enumerate(levels):
            hit = ~done & (prev <= x) & (x <= lv)
            if i == 0:
                out[hit, col] = (x[hit] / lv).astype(np.float32)
            else:
                low = (lv - x[hit]) / (lv - prev)
                out[hit, col + i - 1] = low.astype(np.float32)
                out[hit, col + i] = (1.0 - low).astype(np.float32)
            done |= hit
            prev = lv
        out[~done, col + k - 1] = 1.0
        col += k
    return out


def net_outputs(E, W, b):
    """The engine's sigmoid layer: float sums in input order, bias first, sigmoid in double."""
    E = E.astype(np.float32)
    W = W.astype(np.float32)
    b = b.astype(np.float32)
    outs = np.zeros((E.shape[0], W.shape[0]), dtype=np.float32)
    for u in range(W.shape[0]):
        acc = np.full(E.shape[0], b[u], dtype=np.float32)
        for i in range(E.shape[1]):
            acc = (acc + (E[:, i] * W[u, i]).astype(np.float32)).astype(np.float32)
        outs[:, u] = (1.0 / (1.0 + np.exp(-acc.astype(np.float64)))).astype(np.float32)
    return outs


def fit_network(E, y, cs=OUTPUT_C, seed=SEED, weights=None):
    """One logistic unit per output, each towards the label; classes weighted equally, or
    by the per-sample `weights` when given."""
    from sklearn.linear_model import LogisticRegression

    W = np.zeros((len(cs), E.shape[1]), dtype=np.float32)
    b = np.zeros(len(cs), dtype=np.float32)
    for u, c in enumerate(cs):
        m = LogisticRegression(C=c, class_weight=None if weights is not None else "balanced",
                               max_iter=5000, random_state=seed)
        m.fit(E.astype(np.float64), y, sample_weight=weights)
        W[u] = m.coef_[0].astype(np.float32)
        b[u] = np.float32(m.intercept_[0])
    return W, b


def radius(outs):
    """The decision step's distance to (1, 1) in float; +inf where o0 <= 0.5 (never detected)."""
    o0 = outs[:, 0].astype(np.float32)
    o1 = outs[:, 1].astype(np.float32)
    a = np.float32(1.0) - o0
    c = np.float32(1.0) - o1
    d = np.sqrt((a * a + c * c).astype(np.float32)).astype(np.float32)
    return np.where((o0 > 0.5) & np.isfinite(d), d, np.float32(np.inf))


def choose_threshold(neg_radii, budget):
    """The largest radius that flags at most `budget` of the negatives (floor of count).

    Detection is distance <= threshold, so the threshold sits just below the smallest
    radius that would exceed the allowance.
    """
    r = np.sort(np.asarray(neg_radii, dtype=np.float64))
    r = r[np.isfinite(r)]
    allowed = int(math.floor(budget * len(neg_radii) + 1e-9))
    if allowed >= len(r):
        return 1.5  # every negative may be flagged: the whole corner region
    cut = np.float32(r[allowed])
    return float(np.nextafter(cut, np.float32(0)))


def group_split(groups, labels, seed=SEED, shares=(CALIBRATION_SHARE, TEST_SHARE)):
    """Assigns each sample to 'train', 'calib' or 'test' by group, per label, seeded.

    Near-duplicates share a group, so they land on one side of the split.
    """
    rng = np.random.RandomState(seed)
    part = np.empty(len(groups), dtype=object)
    for lab in sorted(set(labels)):
        gs = sorted({g for g, l in zip(groups, labels) if l == lab})
        rng.shuffle(gs)
        n = len(gs)
        n_cal = max(1, int(round(shares[0] * n))) if n >= 3 else 0
        n_test = max(1, int(round(shares[1] * n))) if n >= 3 else 0
        where = {}
        for i, g in enumerate(gs):
            where[g] = "calib" if i < n_cal else ("test" if i < n_cal + n_test else "train")
        for i, (g, l) in enumerate(zip(groups, labels)):
            if l == lab:
                part[i] = where[g]
    # A group holding several labels follows its first sample's part everywhere.
    first = {}
    for i, g in enumerate(groups):
        first.setdefault(g, part[i])
        part[i] = first[g]
    return part


def split_files(labels, seed=SEED):
    """{file: part} for every labelled file: the split depends on the lists alone (not on
    which files a run could read), so every step of training sees the same parts.

    labels maps file name -> (label, group, ...)."""
    files = sorted(labels)
    part = group_split([labels[f][1] for f in files], [labels[f][0] for f in files], seed=seed)
    return dict(zip(files, part))


def sample_weights(labels):
    """Fitting weights: the positive class and the negative classes weigh the same in all,
    and every negative class weighs the same as any other (so a small class of hard
    negatives counts as much as a large class of easy ones)."""
    labels = np.asarray(labels)
    classes = sorted(set(labels.tolist()))
    neg = [c for c in classes if c != "phishing"]
    w = np.zeros(len(labels), dtype=np.float64)
    for c in classes:
        n = int((labels == c).sum())
        share = 0.5 if c == "phishing" else 0.5 / len(neg)
        w[labels == c] = share * len(labels) / n
    return w


def format_rules(rules):
    toks = []
    for levels in rules:
        if not levels:
            toks += ["1", "0"]
        else:
            toks.append(str(len(levels)))
            toks += [repr(float(lv)) for lv in levels]
    return " ".join(toks)


def format_float(v):
    return "%.9g" % float(np.float32(v))


def format_network(W, b):
    toks = ["1", str(W.shape[1] + 1), str(W.shape[0])]
    for u in range(W.shape[0]):
        toks.append(format_float(b[u]))
        toks += [format_float(w) for w in W[u]]
    return " ".join(toks)


def format_flow(channel):
    size = VECTOR_SIZE[channel]
    doc = {
        "convs": {
            "enc": {"type": "rules", "src": channel + ".rules"},
            "net": {"type": "neur", "src": channel + ".net"},
        },
        "flow": [
            {"name": "features", "input": [[0, size]], "conv": "enc"},
            {"name": "scores", "input": ["features"], "conv": "net"},
        ],
    }
    return json.dumps(doc, separators=(",", ":"))


def roc_auc(scores, y):
    """Area under the ROC curve with ties counted half (Mann-Whitney)."""
    from scipy.stats import rankdata

    y = np.asarray(y, dtype=bool)
    npos, nneg = int(y.sum()), int((~y).sum())
    if npos == 0 or nneg == 0:
        return float("nan")
    r = rankdata(scores)
    return float((r[y].sum() - npos * (npos + 1) / 2) / (npos * nneg))


def bootstrap_ci(fn, n, reps=1000, seed=SEED):
    """95% percentile interval of fn(indices) over `reps` resamples of n items."""
    rng = np.random.RandomState(seed)
    vals = []
    for _ in range(reps):
        v = fn(rng.randint(0, n, n))
        if not math.isnan(v):
            vals.append(v)
    if not vals:
        return (float("nan"), float("nan"))
    return (float(np.percentile(vals, 2.5)), float(np.percentile(vals, 97.5)))
