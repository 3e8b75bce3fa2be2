#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""The smallest implementation that can be held against the kit. It says yes to everything, and the runner has to
notice."""

import json
import sys

for line in sys.stdin:
    answer = {"id": json.loads(line)["id"], "name": "what says yes", "column": "library", "code": 0}
    print(json.dumps(answer), flush=True)
