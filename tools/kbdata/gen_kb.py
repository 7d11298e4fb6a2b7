#!/usr/bin/env python3
"""Writes the lists of the default knowledge base (kb/) from the curated files beside this
script and the public sources that fetch_sources.sh brings into a folder.

    tools/kbdata/fetch_sources.sh /tmp/kbsrc
    tools/kbdata/gen_kb.py --sources /tmp/kbsrc --out kb

Written: orgs, white_domains.txt, lexdb.txt, share_links.txt, categorised_hosts.txt. The
model files, v3.cfg, README.md and CREDITS.md of kb/ are kept by hand. The output depends
only on the inputs (sorted, no dates), so a refresh shows as a reviewable diff; the build
never runs this script. `pelmix kb lint kb` checks the result with the engine's own readers.
"""

import argparse
import json
import os
import re
import sys
from dataclasses import dataclass, field

HERE = os.path.dirname(os.path.abspath(__file__))

# Brand words weigh more than the generic vocabulary: a brand named on a page that is not
# the brand's own site is the core of the imitation.
BRAND_WEIGHT = 50
# Categorised hosts: the category every phishing host gets, and the mask bit of each list.
PHISHING_CATEGORY = 1
MASK_POLKADOT = 0x1
MASK_ETH_PHISHING_DETECT = 0x2
# Ids of the popular sites taken from top-sites (category 6), in rank order.
POPULAR_FIRST_ID = 20001
POPULAR_CATEGORY = 6
MAX_NAME_BYTES = 64
# Popular sites under these suffixes (universities) are white only for the domain itself:
# their subdomains are run by many departments and people, and compromised ones host
# phishing more often than any other kind of popular site.
EXACT_POPULAR_SUFFIXES = ('edu', 'ac.uk', 'ac.jp', 'edu.au', 'ac.in')

DOMAIN_RE = re.compile(r'^[a-z0-9]([a-z0-9-]*[a-z0-9])?(\.[a-z0-9]([a-z0-9-]*[a-z0-9])?)+$')


def fail(message):
    sys.exit('gen_kb: ' + message)


# --- Public Suffix List -------------------------------------------------------------------

class PublicSuffixList:
    """The registrable-domain rule of the list (wildcards, exceptions, private section)."""

    def __init__(self, path):
        self.rules = {}  # rule -> private?
        private = False
        with open(path, encoding='utf-8') as f:
            for line in f:
                line = line.strip()
                if '===BEGIN PRIVATE DOMAINS===' in line:
                    private = True
                if not line or line.startswith('//'):
                    continue
                # Rules in Unicode never match the ASCII hosts written here.
                self.rules[line.split()[0].lower()] = private

    def suffix(self, host):
        """(public suffix, private?) of host: the longest matching rule, '*' = any label."""
        labels = host.split('.')
        best, best_private = labels[-1], False
        for i in range(len(labels)):
            candidate = '.'.join(labels[i:])
            wildcard = '.'.join(['*'] + labels[i + 1:]) if i + 1 < len(labels) else None
            if '!' + candidate in self.rules:
                return '.'.join(labels[i + 1:]), self.rules['!' + candidate]
            if candidate in self.rules:
                return candidate, self.rules[candidate]
            if wildcard and wildcard in self.rules:
                return candidate, self.rules[wildcard]
        return best, best_private

    def registrable(self, host):
        suffix, _ = self.suffix(host)
        if host == suffix:
            return None
        rest = host[:-len(suffix) - 1]
        return rest.split('.')[-1] + '.' + suffix

    def is_private(self, host):
        return self.suffix(host)[1]


# --- the engine's word rules ---------------------------------------------------------------

# Latin capitals of U+00C0..U+024F that the engine leaves as they are.
UNFOLDED = {0x0181, 0x0189, 0x018F, 0x0190, 0x0196, 0x019F, 0x01A6, 0x01A9, 0x01AE, 0x01B1,
            0x01B7, 0x01F6, 0x01F7, 0x0220}
FOLD_SPECIAL = {0x0130: 0x0131, 0x018E: 0x0258, 0x023C: 0x02C4}


def fold(text):
    """The engine's case folding (ASCII, Latin U+00C0-U+024F, Greek and Cyrillic capitals)."""
    out = []
    for ch in text:
        c = ord(ch)
        if 0x41 <= c <= 0x5A:
            c += 0x20
        elif 0x410 <= c <= 0x42F:
            c += 0x20
        elif 0x400 <= c <= 0x40F:
            c += 0x50
        elif 0x391 <= c <= 0x3A9:
            c += 0x20
        elif 0xC0 <= c <= 0x24F:
            if c in FOLD_SPECIAL:
                c = FOLD_SPECIAL[c]
            elif c not in UNFOLDED:
                low = ch.lower()
                if len(low) == 1:
                    c = ord(low)
        out.append(chr(c))
    return ''.join(out)


def engine_words(text):
    """Cuts text into words as the page's word finder does: ASCII marks and a few Unicode
    blocks end a word; a CJK ideograph ends the word it joins."""
    words, word = [], []
    for ch in fold(text):
        c = ord(ch)
        if c < 128 and (c <= 47 or 58 <= c <= 63 or 91 <= c <= 96 or 123 <= c <= 127):
            if word:
                words.append(''.join(word))
                word = []
            continue
        if 0x80 <= c <= 0xA1 or 0x2000 <= c <= 0x20CF or 0x3000 <= c <= 0x303F:
            if word:
                words.append(''.join(word))
                word = []
            continue
        word.append(ch)
        if 0x3400 <= c <= 0xA0AF:
            words.append(''.join(word))
            word = []
    if word:
        words.append(''.join(word))
    return words


def lexdb_text(source):
    """The lexdb spelling of a source text: one lexeme, or a phrase 'head(GAP)word...'.
    '*' adds one word of slack before the next word. None when nothing is left."""
    parts, gap = [], 1
    for token in source.split():
        if token == '*':
            gap += 1
            continue
        for word in engine_words(token):
            parts.append((gap, word))
            gap = 1
    if not parts:
        return None
    text = parts[0][1]
    for g, word in parts[1:]:
        text += '(%d)%s' % (g, word)
    return text


# --- curated inputs ----------------------------------------------------------------------

@dataclass
class Org:
    id: int
    category: int
    country: str
    name: str
    domains: dict = field(default_factory=dict)  # domain -> exact?
    words: list = field(default_factory=list)  # (text, weight)
    origin: str = ''


def read_organisations(path):
    orgs = {}
    with open(path, encoding='utf-8') as f:
        for number, line in enumerate(f, 1):
            line = line.rstrip('\n')
            if not line.strip() or line.lstrip().startswith('#'):
                continue
            where = '%s:%d' % (os.path.basename(path), number)
            parts = line.split('|')
            if len(parts) != 3:
                fail(where + ': expected ID CATEGORY COUNTRY NAME | DOMAINS | WORDS')
            head = parts[0].split(None, 3)
            if len(head) != 4:
                fail(where + ': expected ID CATEGORY COUNTRY NAME')
            org_id, category, country, name = int(head[0]), int(head[1]), head[2], head[3].strip()
            if not 1 <= org_id < POPULAR_FIRST_ID or not 0 <= category <= 9:
                fail(where + ': id or category out of range')
            if org_id in orgs:
                fail(where + ': id %d given twice' % org_id)
            if len(name.encode('utf-8')) > MAX_NAME_BYTES:
                fail(where + ': name longer than %d bytes' % MAX_NAME_BYTES)
            org = Org(org_id, category, country, name, origin=where)
            for token in parts[1].split():
                domain, _, flag = token.partition(':')
                if flag not in ('', 'exact') or not DOMAIN_RE.match(domain):
                    fail(where + ': bad domain ' + token)
                if domain in org.domains:
                    fail(where + ': domain %s given twice' % domain)
                org.domains[domain] = flag == 'exact'
            for entry in parts[2].split(';'):
                entry = entry.strip()
                if not entry:
                    continue
                weight = BRAND_WEIGHT
                m = re.match(r'^(.*?)=(\d+)$', entry)
                if m:
                    entry, weight = m.group(1).strip(), int(m.group(2))
                org.words.append((entry, weight))
            orgs[org_id] = org
    return orgs


def read_shared_content(path):
    subdomains, shorteners, files, links = set(), set(), set(), []
    with open(path, encoding='utf-8') as f:
        for number, line in enumerate(f, 1):
            fields = line.split('#', 1)[0].split()
            if not fields:
                continue
            where = '%s:%d' % (os.path.basename(path), number)
            kind = fields[0]
            if kind in ('subdomains', 'shortener', 'files') and len(fields) == 2:
                {'subdomains': subdomains, 'shortener': shorteners,
                 'files': files}[kind].add(fields[1].lower())
            elif kind == 'link' and len(fields) == 3 and fields[2].startswith('/'):
                links.append((fields[1], fields[2]))
            else:
                fail(where + ': expected "subdomains D", "shortener D", "files D" or '
                     '"link HOST /PATH"')
    return subdomains, shorteners, files, links


def read_lexicon(path):
    entries = []
    with open(path, encoding='utf-8') as f:
        for number, line in enumerate(f, 1):
            if not line.strip() or line.lstrip().startswith('#'):
                continue
            head, sep, text = line.partition('|')
            fields = head.split()
            if not sep or len(fields) != 3 or not text.strip():
                fail('%s:%d: expected LANG WEIGHT FLAGS | TEXT' % (os.path.basename(path), number))
            entries.append((fields[0], text.strip(), int(fields[1]), int(fields[2])))
    return entries


# --- public sources ------------------------------------------------------------------------

def read_apple_groups(path):
    """Shared-credential groups: each a set of domains that one organisation runs."""
    with open(path, encoding='utf-8') as f:
        data = json.load(f)
    groups = []
    for entry in data:
        domains = entry.get('shared', []) + entry.get('from', []) + entry.get('to', [])
        groups.append([d.lower() for d in domains])
    return groups


# auth0-lock dictionary keys whose text labels a login form, with weight and flags.
AUTH0_KEYS = {
    'passwordInputPlaceholder': (25, 1),
    'usernameInputPlaceholder': (20, 8),
    'usernameOrEmailInputPlaceholder': (20, 8),
    'phoneNumberInputPlaceholder': (20, 8),
    'codeInputPlaceholder': (20, 1),
    'loginLabel': (15, 0),
    'loginSubmitLabel': (15, 0),
    'forgotPasswordTitle': (20, 0),
    'forgotPasswordAction': (20, 0),
    'mfaLoginTitle': (20, 0),
}
AUTH0_LANGUAGES = ['en', 'de', 'fr', 'es', 'it', 'pt', 'pt-br', 'nl', 'pl', 'ru', 'tr', 'ja',
                   'zh', 'zh-tw', 'ko', 'sv', 'da', 'nb', 'fi', 'cs', 'ro', 'hu', 'el', 'he',
                   'uk', 'id', 'vi']
AUTH0_LINE = re.compile(r"^\s*(\w+):\s*(['\"])(.*)\2,?\s*$")


def read_auth0_lock(folder):
    entries = []
    for lang in AUTH0_LANGUAGES:
        path = os.path.join(folder, 'lib', 'i18n', lang + '.js')
        if not os.path.exists(path):
            continue
        with open(path, encoding='utf-8') as f:
            for line in f:
                m = AUTH0_LINE.match(line)
                if not m or m.group(1) not in AUTH0_KEYS:
                    continue
                text = m.group(3).replace("\\'", "'")
                if '%' in text or '<' in text or '@' in text:
                    continue
                weight, flags = AUTH0_KEYS[m.group(1)]
                entries.append((lang, text, weight, flags))
    return entries


def simple_icon_names(path):
    """Brand names by their letters and digits ("theguardian": "The Guardian")."""
    with open(path, encoding='utf-8') as f:
        icons = json.load(f)
    names = {}
    for icon in icons:
        title = icon['title']
        if title.isascii():
            names.setdefault(re.sub(r'[^a-z0-9]', '', title.lower()), title)
    return names


def read_phishing_hosts(sources):
    """Host -> mask of the lists naming it, and the hosts those lists mark as legitimate."""
    hosts, allowed = {}, set()
    with open(os.path.join(sources, 'polkadot-phishing', 'all.json'), encoding='utf-8') as f:
        polkadot = json.load(f)
    for host in polkadot['deny']:
        hosts[host] = hosts.get(host, 0) | MASK_POLKADOT
    allowed.update(polkadot['allow'])
    eth = os.path.join(sources, 'eth-phishing-detect', 'package', 'src')
    with open(os.path.join(eth, 'config.json'), encoding='utf-8') as f:
        config = json.load(f)
    for host in config['blacklist']:
        hosts[host] = hosts.get(host, 0) | MASK_ETH_PHISHING_DETECT
    allowed.update(config['whitelist'])
    with open(os.path.join(eth, 'hosts.txt'), encoding='utf-8') as f:
        for line in f:
            fields = line.split()
            if len(fields) == 2 and fields[0] == '0.0.0.0':
                hosts[fields[1]] = hosts.get(fields[1], 0) | MASK_ETH_PHISHING_DETECT
    return hosts, allowed


def clean_host(host):
    host = host.strip().lower().rstrip('.')
    while host.startswith('*.'):
        host = host[2:]
    if host.startswith('www.'):
        host = host[4:]  # the checkers strip it before they ask
    return host if DOMAIN_RE.match(host) else None


# --- building -----------------------------------------------------------------------------

def under(host, domains):
    """True when host is one of domains or a subdomain of one."""
    labels = host.split('.')
    return any('.'.join(labels[i:]) in domains for i in range(len(labels)))


class WhiteSet:
    """Which org owns which domain; answers roughly as the engine's white list does."""

    def __init__(self):
        self.owner = {}  # domain -> org id
        self.exact = set()

    def add(self, domain, org_id, exact):
        self.owner[domain] = org_id
        if exact:
            self.exact.add(domain)

    def is_white(self, host):
        if host in self.owner:
            return True
        labels = host.split('.')
        return any('.'.join(labels[i:]) in self.owner and '.'.join(labels[i:]) not in self.exact
                   for i in range(1, len(labels)))


def build(args):
    psl = PublicSuffixList(args.psl)
    orgs = read_organisations(os.path.join(args.curated, 'organisations.txt'))
    subdomains, shorteners, files, links = read_shared_content(
        os.path.join(args.curated, 'shared_content.txt'))
    src = args.sources
    groups = read_apple_groups(
        os.path.join(src, 'password-manager-resources', 'quirks', 'shared-credentials.json'))
    no_white = subdomains | shorteners
    notes = []

    def allowed_white(domain, exact):
        if domain in shorteners or under(domain, shorteners):
            return False
        if under(domain, subdomains):
            return exact and domain in subdomains
        return True

    # Curated organisations, then their shared-credential groups.
    white = WhiteSet()
    for org in orgs.values():
        for domain, exact in org.domains.items():
            if not allowed_white(domain, exact):
                fail('%s: %s hosts content anyone can publish: list it "exact" or not at all'
                     % (org.origin, domain))
            if not psl.registrable(domain):
                fail('%s: %s is a public suffix' % (org.origin, domain))
            if domain in white.owner:
                fail('%s: %s already belongs to organisation %d'
                     % (org.origin, domain, white.owner[domain]))
            white.add(domain, org.id, exact)
    for org in sorted(orgs.values(), key=lambda o: o.id):
        mine = {psl.registrable(d) or d for d in org.domains}
        for group in groups:
            regs = [psl.registrable(d) for d in group]
            if not mine.intersection(r for r in regs if r):
                continue
            for reg in regs:
                if not reg or reg in org.domains or under(reg, no_white) or psl.is_private(reg):
                    continue
                if white.is_white(reg):
                    if white.owner.get(reg) not in (None, org.id):
                        notes.append('group domain %s of %s left with organisation %d'
                                     % (reg, org.name, white.owner[reg]))
                    continue
                org.domains[reg] = False
                white.add(reg, org.id, False)

    # Popular sites under organisations of their own (category 6), named from the icon set.
    with open(os.path.join(src, 'top-sites', 'package', 'top-sites.json'), encoding='utf-8') as f:
        top = json.load(f)
    names = simple_icon_names(
        os.path.join(src, 'simple-icons', 'package', 'data', 'simple-icons.json'))
    next_id = POPULAR_FIRST_ID
    for site in sorted(top, key=lambda s: s['rank']):
        host = site['rootDomain'].lower()
        if host.startswith('www.'):
            host = host[4:]
        if not DOMAIN_RE.match(host):
            continue
        reg = psl.registrable(host)
        if not reg or psl.is_private(host) or under(host, no_white) or under(reg, no_white):
            continue
        if reg in files or reg.split('.')[0] == 'example':
            continue
        if white.is_white(reg) or reg in white.owner:
            continue
        # A short label names too many things ("go", "rt"): those keep their domain.
        label = reg.split('.')[0]
        name = names.get(label) if len(label) >= 4 else None
        name = name or reg
        if len(name.encode('utf-8')) > MAX_NAME_BYTES:
            name = reg
        exact = psl.suffix(reg)[0] in EXACT_POPULAR_SUFFIXES
        org = Org(next_id, POPULAR_CATEGORY, 'ZZ', name, {reg: exact}, [], 'top-sites')
        orgs[next_id] = org
        white.add(reg, next_id, exact)
        next_id += 1

    write_orgs(args.out, orgs)
    write_white_domains(args.out, orgs)
    write_lexdb(args.out, orgs, read_lexicon(os.path.join(args.curated, 'lexicon.txt')) +
                read_auth0_lock(os.path.join(src, 'auth0-lock', 'package')))
    write_share_links(args.out, links)
    write_categorised_hosts(args.out, src, white, no_white)
    for note in notes:
        print('note: ' + note)


def write_file(folder, name, lines):
    with open(os.path.join(folder, name), 'w', encoding='utf-8', newline='\n') as f:
        for line in lines:
            f.write(line + '\n')
    print('%s: %d lines' % (os.path.join(folder, name), len(lines)))


def write_orgs(out, orgs):
    lines = []
    for org in sorted(orgs.values(), key=lambda o: o.id):
        lines += ['%d %d' % (org.id, org.category), org.name]
    write_file(out, 'orgs', lines)


def write_white_domains(out, orgs):
    lines = ['# ORG_ID DOMAIN [exact]. Written by tools/kbdata/gen_kb.py: change the sources',
             '# there (organisations.txt, shared_content.txt) and run it again.']
    for org in sorted(orgs.values(), key=lambda o: o.id):
        for domain in sorted(org.domains):
            lines.append('%d %s%s' % (org.id, domain, ' exact' if org.domains[domain] else ''))
    write_file(out, 'white_domains.txt', lines)


def write_lexdb(out, orgs, vocabulary):
    stats = {}  # lexdb text -> [weight, org, flags, origin]
    for org in sorted(orgs.values(), key=lambda o: o.id):
        for source, weight in org.words:
            text = lexdb_text(source)
            if text is None:
                fail('%s: brand word "%s" has no letters' % (org.origin, source))
            known = stats.get(text)
            if known and known[1] != org.id:
                fail('%s: brand word "%s" is already bound to organisation %d'
                     % (org.origin, source, known[1]))
            stats[text] = [max(weight, known[0]) if known else weight, org.id, 0, org.origin]
    for lang, source, weight, flags in vocabulary:
        text = lexdb_text(source)
        if text is None:
            continue
        known = stats.get(text)
        if known and known[1]:
            continue  # a brand word stays the brand's
        if known:
            known[0], known[2] = max(known[0], weight), known[2] | flags
        else:
            stats[text] = [weight, 0, flags, lang]
    phrases = sorted(t for t in stats if '(' in t)
    lexemes = sorted(t for t in stats if '(' not in t)
    words, heads, items = set(lexemes), set(), 0
    for phrase in phrases:
        parts = re.split(r'\(\d+\)', phrase)
        heads.add(parts[0])
        words.update(parts)
        items += len(parts) - 1
    nodes = sum(len(w.encode('utf-8')) for w in words) + 1
    lines = ['#%d %d %d %d %d' % (len(words - heads) + 1, len(heads), items, len(phrases), nodes)]
    for text in phrases + lexemes:
        weight, org_id, flags, _ = stats[text]
        lines.append('%s %d %d %d' % (text, weight, org_id, flags))
    write_file(out, 'lexdb.txt', lines)


def write_share_links(out, links):
    write_file(out, 'share_links.txt', ['%s %s' % link for link in sorted(set(links))])


def write_categorised_hosts(out, src, white, no_white):
    listed, allowed = read_phishing_hosts(src)
    allowed = {h for h in (clean_host(a) for a in allowed) if h}
    hosts = {}
    for raw, mask in listed.items():
        host = clean_host(raw)
        if not host or '.' not in host or host in allowed:
            continue
        if white.is_white(host) or host in no_white:
            continue  # a white host is never categorised; nor a whole platform
        hosts[host] = hosts.get(host, 0) | mask
    lines = ['# HOST CATEGORY MASK: %d = phishing; mask 0x%x polkadot-js/phishing, 0x%x'
             % (PHISHING_CATEGORY, MASK_POLKADOT, MASK_ETH_PHISHING_DETECT) +
             ' eth-phishing-detect.',
             '# Written by tools/kbdata/gen_kb.py from the lists named in kb/CREDITS.md.']
    for host in sorted(hosts):
        lines.append('%s %d 0x%x' % (host, PHISHING_CATEGORY, hosts[host]))
    write_file(out, 'categorised_hosts.txt', lines)


def main(argv=None):
    parser = argparse.ArgumentParser(description=__doc__.split('\n')[0])
    parser.add_argument('--sources', required=True, help='folder filled by fetch_sources.sh')
    parser.add_argument('--out', required=True, help='the kb/ folder to write into')
    parser.add_argument('--psl', default='/usr/share/publicsuffix/public_suffix_list.dat')
    parser.add_argument('--curated', default=HERE, help='folder of the curated lists')
    build(parser.parse_args(argv))


if __name__ == '__main__':
    main()
