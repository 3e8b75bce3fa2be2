# SPDX-License-Identifier: Apache-2.0
"""What make_cases.py makes the cases with: a module a family, or two."""

from . import algorithms, chains, kinds, lists, manifests, named, readers, sources, tags, thresholds, trees, warned

_MODULES = (chains, thresholds, tags, readers, kinds, lists, sources, manifests, trees, named, warned, algorithms)
FAMILIES = [module.make for module in _MODULES]
