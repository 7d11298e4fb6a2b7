#!/usr/bin/env python3
"""Tests of gen_kb.py: the engine's word rules, the suffix list, and a whole run over small
curated lists and small stand-ins for the public sources."""

import contextlib
import io
import json
import os
import sys
import tempfile
import unittest

sys.path.insert(0, os.path.dirname(os.path.abspath(__file__)))
import gen_kb  # noqa: E402

PSL = '/usr/share/publicsuffix/public_suffix_list.dat'


class WordRules(unittest.TestCase):
    def test_lexdb_text(self):
        cases = [
            ('Passwort', 'passwort'),
            ('mot de passe', 'mot(1)de(1)passe'),
            ('verify * account', 'verify(2)account'),
            ('e-posta adresi', 'e(1)posta(1)adresi'),
            ("caisse d'epargne", 'caisse(1)d(1)epargne'),
            ('ЯНДЕКС', 'яндекс'),
            ('İş Bankası', 'ış(1)bankası'),  # the engine folds U+0130 to the dotless i
            ('支付宝', '支(1)付(1)宝'),  # every ideograph ends its word
            ('ゆうちょ銀行', 'ゆうちょ銀(1)行'),  # kana run on into the ideograph after them
            ('24小时内', '24小(1)时(1)内'),
            ('ペイペイ', 'ペイペイ'),
            ('---', None),
        ]
        for source, expected in cases:
            self.assertEqual(gen_kb.lexdb_text(source), expected, source)


@unittest.skipUnless(os.path.exists(PSL), 'needs the publicsuffix package')
class SuffixList(unittest.TestCase):
    psl = gen_kb.PublicSuffixList(PSL) if os.path.exists(PSL) else None

    def test_registrable(self):
        cases = [
            ('www.paypal.co.uk', 'paypal.co.uk', False),
            ('paypal.com', 'paypal.com', False),
            ('a.b.github.io', 'b.github.io', True),  # a private rule
            ('gov.uk', None, False),
            ('www.ck', 'www.ck', False),  # an exception to the wildcard *.ck
            ('x.y.ck', 'x.y.ck', False),  # the wildcard makes y.ck a suffix
        ]
        for host, registrable, private in cases:
            self.assertEqual(self.psl.registrable(host), registrable, host)
            self.assertEqual(self.psl.is_private(host), private, host)


class WhiteSet(unittest.TestCase):
    def test_subdomains_unless_exact(self):
        white = gen_kb.WhiteSet()
        white.add('paypal.com', 1, False)
        white.add('wordpress.com', 2, True)
        self.assertTrue(white.is_white('paypal.com'))
        self.assertTrue(white.is_white('www.paypal.com'))
        self.assertFalse(white.is_white('paypal.com.evil.example'))
        self.assertTrue(white.is_white('wordpress.com'))
        self.assertFalse(white.is_white('someone.wordpress.com'))


def write(path, text):
    os.makedirs(os.path.dirname(path), exist_ok=True)
    with open(path, 'w', encoding='utf-8') as f:
        f.write(text)


@unittest.skipUnless(os.path.exists(PSL), 'needs the publicsuffix package')
class WholeRun(unittest.TestCase):
    ORGS = ('1001 0 GB Bank One | bankone.co.uk | bank one; bankone\n'
            '2001 1 US Mail Two | mailtwo.com blog.example:exact | mail two\n')

    def run_generator(self, orgs=ORGS, lexicon='en 30 1 | password\nen 20 0 | sign in\n'):
        self.dir = tempfile.mkdtemp()
        curated, src, out = (os.path.join(self.dir, d) for d in ('curated', 'src', 'out'))
        os.makedirs(out)
        write(os.path.join(curated, 'organisations.txt'), orgs)
        write(os.path.join(curated, 'lexicon.txt'), lexicon)
        write(os.path.join(curated, 'shared_content.txt'),
              'subdomains blog.example\nsubdomains github.io\nshortener short.example\n'
              'files share.example\nlink docs.mailtwo.com /forms\n')
        write(os.path.join(src, 'password-manager-resources', 'quirks',
                           'shared-credentials.json'),
              json.dumps([{'shared': ['bankone.co.uk', 'bankone.com']},
                          {'from': ['old-mailtwo.com'], 'to': ['mailtwo.com']},
                          {'shared': ['unrelated.com', 'other.com']}]))
        write(os.path.join(src, 'top-sites', 'package', 'top-sites.json'),
              json.dumps([{'rank': r, 'rootDomain': d} for r, d in enumerate(
                  ['news.daily-paper.org', 'mailtwo.com', 'x.github.io', 'share.example',
                   'short.example', 'theguardian.com', 'marketplatform.google....',
                   'www.uni.edu'], 1)]))
        write(os.path.join(src, 'simple-icons', 'package', 'data', 'simple-icons.json'),
              json.dumps([{'title': 'The Guardian', 'slug': 'theguardian'}]))
        write(os.path.join(src, 'auth0-lock', 'package', 'lib', 'i18n', 'de.js'),
              "  passwordInputPlaceholder: 'Ihr Passwort',\n  loginAtLabel: 'Bei %s',\n")
        write(os.path.join(src, 'polkadot-phishing', 'all.json'),
              json.dumps({'deny': ['www.phish.example', 'login.bankone.co.uk', 'allowed.example',
                                   'Both.example'],
                          'allow': ['allowed.example']}))
        eth = os.path.join(src, 'eth-phishing-detect', 'package', 'src')
        write(os.path.join(eth, 'config.json'),
              json.dumps({'blacklist': ['both.example', 'github.io'], 'whitelist': []}))
        write(os.path.join(eth, 'hosts.txt'), '127.0.0.1 localhost\n0.0.0.0 hosts.example\n')
        with contextlib.redirect_stdout(io.StringIO()):
            gen_kb.main(['--sources', src, '--out', out, '--curated', curated, '--psl', PSL])
        return {name: open(os.path.join(out, name), encoding='utf-8').read()
                for name in os.listdir(out)}

    def test_lists(self):
        kb = self.run_generator()
        self.assertEqual(kb['orgs'], '1001 0\nBank One\n2001 1\nMail Two\n'
                                     '20001 6\ndaily-paper.org\n20002 6\nThe Guardian\n'
                                     '20003 6\nuni.edu\n')
        white = [line for line in kb['white_domains.txt'].splitlines() if line[0] != '#']
        self.assertEqual(white, ['1001 bankone.co.uk', '1001 bankone.com',
                                 '2001 blog.example exact', '2001 mailtwo.com',
                                 '2001 old-mailtwo.com', '20001 daily-paper.org',
                                 '20002 theguardian.com', '20003 uni.edu exact'])
        self.assertEqual(kb['share_links.txt'], 'docs.mailtwo.com /forms\n')
        hosts = [line for line in kb['categorised_hosts.txt'].splitlines() if line[0] != '#']
        self.assertEqual(hosts, ['both.example 1 0x3', 'hosts.example 1 0x2',
                                 'phish.example 1 0x1'])
        lexdb = kb['lexdb.txt'].splitlines()
        self.assertTrue(lexdb[0].startswith('#'))
        self.assertEqual(lexdb[1:], ['bank(1)one 50 1001 0', 'ihr(1)passwort 25 0 1',
                                     'mail(1)two 50 2001 0', 'sign(1)in 20 0 0',
                                     'bankone 50 1001 0', 'password 30 0 1'])

    def test_faults_stop_the_run(self):
        cases = [
            ('1001 0 GB A | co.uk | a\n', 'public suffix'),
            ('1001 0 GB A | x.blog.example | a\n', 'anyone can publish'),
            ('1001 0 GB A | short.example:exact | a\n', 'anyone can publish'),
            ('1001 0 GB A | a.com | same\n2001 1 US B | b.com | same\n', 'already bound'),
            ('1001 0 GB A | a.com | a\n2001 1 US B | a.com | b\n', 'already belongs'),
            ('1001 0 GB A | a.com\n', 'expected ID'),
            ('1001 12 GB A | a.com | a\n', 'out of range'),
        ]
        for orgs, message in cases:
            with self.assertRaises(SystemExit) as stop:
                self.run_generator(orgs=orgs)
            self.assertIn(message, str(stop.exception), orgs)


if __name__ == '__main__':
    unittest.main()
