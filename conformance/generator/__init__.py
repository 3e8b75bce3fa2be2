# SPDX-License-Identifier: Apache-2.0
"""What make_cases.py makes the cases with."""

from . import chains, kinds, lists, manifests, named, readers, sources, tags, thresholds, trees, warned

FAMILIES = [chains.make, tags.make, readers.make, lists.make, manifests.make, trees.make, thresholds.make, sources.make, named.make, warned.make, kinds.make]
