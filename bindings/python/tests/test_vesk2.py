# SPDX-License-Identifier: Apache-2.0
"""The module against the built library, with keys, manifests and lists that the built command makes.

    PATH=build/release/bin:$PATH LD_LIBRARY_PATH=build/release/lib PYTHONPATH=bindings/python \\
        python3 -m unittest discover bindings/python/tests
"""

from __future__ import annotations

import os
import shutil
import subprocess
import tempfile
import unittest
from datetime import datetime, timedelta, timezone
from pathlib import Path
from typing import Callable

import vesk2

TAG = "(install (app calc))"
LISTS = "calc (revoke all)"
NOW = datetime.now(timezone.utc)
made = tempfile.mkdtemp()


def run(*words: str) -> None:
    subprocess.run(["vesk2", *words], check=True, capture_output=True)


def setUpModule() -> None:
    """A machine that trusts a vendor, who trusts a signer, once under revocation, who signed a directory."""
    os.chdir(made)
    os.environ.update(VESK2_GLOBAL="store", VESK2_HOME="home")
    run("key", "new", "vendor", "signer", "revoker")
    run("acl", "grant", "--subject", "vendor.pub", "--tag", "(install)", "--propagate")
    run("acl", "grant", "--subject", "revoker.pub", "--tag", LISTS, "--propagate")
    issue = ["cert", "issue", "--key", "vendor.pem", "--subject", "signer.pub", "--tag", TAG]
    run(*issue, "--owner", "Signer", "--not-after", "2090", "-o", "signer.cert")
    run(*issue, "--revocation", LISTS, "-o", "watched.cert")
    os.makedirs("lists")
    crl = ["crl", "issue", "--key", "revoker.pem", "--tag", LISTS, "--not-after", "2090"]
    run(*crl, "-o", "lists/first.crl")
    for directory in ("app/lib/deep", "app/empty"):
        os.makedirs(directory)
    for name in (b"app/calc", b"app/lib/pi", b"app/lib/deep/e", b"app/lib/\xff\n"):
        Path(os.fsdecode(name)).write_text("as signed")
    run("manifest", "sign", "app", "--key", "signer.pem", "--cert", "signer.cert", "-o", "app.manifest")


def tearDownModule() -> None:
    shutil.rmtree(made)


class Scene(unittest.TestCase):
    """A copy of what was made, for each test."""

    def setUp(self) -> None:
        self.work = Path(tempfile.mkdtemp())
        self.addCleanup(shutil.rmtree, self.work)
        os.chdir(self.work)
        shutil.copytree(made, ".", dirs_exist_ok=True)
        vesk2.set_stores("store", "home")


class Directories(Scene):
    def test_verdicts(self) -> None:
        app, lib = Path("app"), Path("app/lib")
        rows: list[tuple[str, Callable[[], object], str, tuple[Path, ...], tuple[Path, ...], tuple[Path, ...]]] = [
            ("nothing", lambda: None, "ok", (), (), ()),
            ("a byte", lambda: (app / "calc").write_text("changed"), "hash-mismatch", (app / "calc",), (), ()),
            ("a file gone", (app / "calc").unlink, "file-not-found", (), (app / "calc",), ()),
            ("a file more", (lib / "more").touch, "extra-files", (), (), (lib / "more",)),
            ("one at the top", (app / "top").touch, "extra-files", (), (), (app / "top",)),
        ]
        for what, change, reason, changed, missing, unlisted in rows:
            with self.subTest(what):
                shutil.rmtree(app)
                shutil.copytree(Path(made, "app"), app)
                change()
                result = vesk2.verify("app", b"app.manifest", tag=TAG)
                self.assertEqual((result.ok, bool(result)), (reason == "ok", reason == "ok"))
                self.assertEqual(result.reason, reason)
                self.assertEqual(result.changed, changed)
                self.assertEqual(result.missing, missing)
                self.assertEqual(result.unlisted, unlisted)

    def test_valid_entries_and_time(self) -> None:
        result = vesk2.verify(self.work / "app", "app.manifest", tag=TAG)
        names = {os.fsencode(path.relative_to(self.work)) for path in result.valid}
        self.assertEqual(names, {b"app/calc", b"app/lib/pi", b"app/lib/deep/e", b"app/lib/\xff\n", b"app/lib", b"app/lib/deep", b"app/empty"})
        why = result.explanation
        assert result.signed_at is not None and why is not None and why.holds_until is not None
        self.assertRegex(result.signer or "", "^sha256:[0-9a-f]{64}$")
        self.assertEqual((why.complete, why.reasons, why.listed), (True, (), 4))
        self.assertEqual((why.entry, why.holds_until.year, why.ended_by), ("vendor.acl", 2090, "certificate"))
        self.assertEqual(why.end_certificate, why.certificates[0])
        self.assertLess(abs(result.signed_at - NOW), timedelta(minutes=10))

    def test_what_may_be_there(self) -> None:
        Path("app/top").touch()
        Path("app/lib/more").touch()
        shutil.copy("app.manifest", "app/app.manifest")
        rows = [
            ("app/app.manifest", {"allow_unlisted": True}, True),
            ("app/app.manifest", {"ignore": ["top", "lib/more"]}, True),
            ("app/app.manifest", {"ignore": ["top/x", "lib/more"]}, False),
            ("app.manifest", {"ignore": ["top", "lib/more"]}, False),
        ]
        for manifest, options, ok in rows:
            with self.subTest(options=options):
                self.assertEqual(vesk2.verify("app", manifest, tag=TAG, **options).ok, ok)  # type: ignore[arg-type]

    def test_authority(self) -> None:
        future = datetime(2095, 1, 1, tzinfo=timezone.utc)
        self.assertTrue(vesk2.verify("app", "app.manifest", tag=TAG, at=NOW))
        for options, kind in (({"tag": "(install (app mail))"}, "tag"), ({"tag": TAG, "at": future}, "period")):
            result = vesk2.verify("app", "app.manifest", **options)  # type: ignore[arg-type]
            self.assertEqual((result.ok, result.reason), (False, "not-authorized"))
            self.assertEqual((result.message, result.reasons[0].kind), ("nothing is granted", kind))
        shutil.move("store/acl", "acl")
        self.assertFalse(vesk2.verify("app", "app.manifest", tag=TAG))
        self.assertTrue(vesk2.verify("app", "app.manifest", tag=TAG, trust_also="acl"))

    def test_listeners(self) -> None:
        heard: list[object] = []
        with vesk2.Manifest("app", "app.manifest", TAG) as manifest:
            manifest.listen(lambda path, size: heard.append((path, size)), heard.append)
            self.assertTrue(manifest.verify())
            self.assertIn((Path("app/calc"), 9), heard)
            self.assertEqual(sum(count for count in heard if isinstance(count, int)), 36)
            manifest.listen(read=lambda count: [][count])
            with self.assertRaises(IndexError):
                manifest.verify()
            manifest.listen()
            self.assertTrue(manifest.verify())

    def test_compare(self) -> None:
        Path("app/calc").write_text("new")
        run("manifest", "sign", "app", "--key", "signer.pem", "--cert", "signer.cert", "-o", "new.manifest")
        with vesk2.Manifest("app", "app.manifest", TAG) as manifest:
            self.assertEqual(manifest.compare("new.manifest").changed, (Path("calc"),))
            with self.assertRaises(FileNotFoundError):
                manifest.compare("none.manifest")


class Chains(Scene):
    def test_certificates(self) -> None:
        with vesk2.Chain("signer.cert") as chain:
            (one,) = chain.certificates
            self.assertEqual((one.tag, one.owner, one.not_before), (TAG, "Signer", None))
            assert one.not_after is not None and one.key is not None
            self.assertEqual((one.not_after.year, one.key[:1]), (2090, b"0"))
            self.assertTrue(chain.verify(TAG, at=NOW))
            self.assertTrue(chain.verify(TAG, not_before=NOW))
            self.assertEqual(chain.verify("(install)", at=NOW).reason, "package-not-granted")
            self.assertFalse(chain.verify(TAG, at=datetime(2095, 1, 1, tzinfo=timezone.utc)))
            with self.assertRaises(TypeError):
                chain.verify(TAG)
        self.assertEqual(vesk2.find_certificates("."), ("signer.cert", "watched.cert"))

    def test_revocation(self) -> None:
        with vesk2.Chain("watched.cert") as chain:
            answer = chain.verify(TAG, at=NOW)
            self.assertEqual(answer.reason, "crl-not-found")
            self.assertEqual([(why.kind, why.certificate, why.source) for why in answer.reasons], [("undetermined", 1, LISTS)])
            vesk2.import_lists("lists")
            self.assertTrue(chain.verify(TAG, at=NOW))
            run("crl", "issue", "--key", "revoker.pem", "--tag", LISTS, "--not-after", "2091",
                "--revoke-cert", "watched.cert:1", "-o", "lists/second.crl")  # fmt: skip
            vesk2.import_lists("lists")
            self.assertEqual(chain.verify(TAG, at=NOW + timedelta(hours=1)).reason, "cert-revoked")
        with vesk2.RevocationList(tag=LISTS) as stored, vesk2.RevocationList("lists/first") as first:
            assert stored.not_after is not None and first.not_after is not None
            self.assertEqual((stored.tag, stored.not_after.year, first.not_after.year), (LISTS, 2091, 2090))
            self.assertTrue(first.verify(LISTS, not_before=NOW, not_after=NOW))
            self.assertEqual(first.verify("mail (revoke all)").reason, "not-authorized")


class Trouble(Scene):
    def test_exceptions(self) -> None:
        closed = vesk2.Manifest("app", "app.manifest", TAG)
        closed.close()
        Path("rubbish.cert").write_bytes(b"(8:sequence")
        rows: list[tuple[type[Exception], Callable[[], object]]] = [
            (FileNotFoundError, lambda: vesk2.verify("app", "none.manifest", tag=TAG)),
            (ValueError, lambda: vesk2.verify("app\0", "app.manifest", tag=TAG)),
            (ValueError, lambda: vesk2.verify("app", "app.manifest", tag=TAG, at=datetime(2030, 1, 1))),
            (ValueError, lambda: vesk2.verify("app", "app.manifest", tag=TAG, at=datetime.fromtimestamp(0, timezone.utc))),
            (ValueError, lambda: vesk2.set_stores("x" * 4095)),
            (ValueError, closed.verify),
            (TypeError, lambda: vesk2.RevocationList()),
        ]
        for kind, call in rows:
            with self.subTest(kind=kind), self.assertRaises(kind):
                call()

    def test_errors_carry_code_and_words(self) -> None:
        rows: list[tuple[Callable[[], object], int, str]] = [
            (lambda: vesk2.verify("app", "app.manifest", tag="(install"), 29, "invalid-s-expression"),
            (lambda: vesk2.Chain("none.cert"), 7, "file-open"),
            (lambda: vesk2.RevocationList(tag=LISTS), 26, "find-dir"),
            (lambda: vesk2.import_lists("nowhere"), 5, "file-not-found"),
        ]
        for call, code, reason in rows:
            with self.subTest(reason), self.assertRaises(vesk2.Error) as caught:
                call()
            self.assertEqual((caught.exception.code, caught.exception.reason), (code, reason))
            self.assertIn(f"({reason}, {code})", str(caught.exception))

    def test_rubbish_is_refused(self) -> None:
        for text in (b"", b"(8:manifest", b"\0" * 100):
            Path("rubbish").write_bytes(text)
            self.assertFalse(vesk2.verify("app", "rubbish", tag=TAG))

    def test_version(self) -> None:
        self.assertEqual(vesk2.library_version(), vesk2.__version__)


if __name__ == "__main__":
    unittest.main()
