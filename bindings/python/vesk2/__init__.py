# SPDX-License-Identifier: Apache-2.0
"""Is this directory exactly what its signed manifest says, and was its signer authorized to say so?

    import vesk2

    result = vesk2.verify("app", "app.manifest", tag="(install (app calc))")
    if not result:
        print(result.message, *result.changed, *result.missing, *result.unlisted)
        for reason in result.reasons:  # why nothing was granted
            print(reason.kind, reason.text)

The answer comes from files on this machine, through libvesk2.so.1. A refusal is a result; what could not be
decided is an exception, and must be treated as a refusal. Names of files and texts of certificates were
chosen by whoever wrote them: use repr() before they reach a terminal.
"""

from ._answer import Answer, Explanation, Reason
from ._chain import Certificate, Chain, RevocationList, find_certificates, import_lists
from ._errors import Error
from ._library import lib as _lib
from ._library import set_stores
from ._manifest import Manifest, Result, verify

__version__ = "1.1.0"

__all__ = [
    "Answer",
    "Certificate",
    "Chain",
    "Error",
    "Explanation",
    "Manifest",
    "Reason",
    "Result",
    "RevocationList",
    "find_certificates",
    "import_lists",
    "library_version",
    "set_stores",
    "verify",
]


def library_version() -> str:
    """The version of the library, which may be newer than this module's."""
    number = _lib.Vesk2VersionNumber()
    return f"{number // 10000}.{number // 100 % 100}.{number % 100}"
