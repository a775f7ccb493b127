"""Settings of hypothesis for all files: repeatable and small, or long by HYPOTHESIS_PROFILE=long."""

from __future__ import annotations

import os

from hypothesis import HealthCheck, settings

COMMON = {
    "database": None,
    "deadline": None,
    "suppress_health_check": list(HealthCheck),
    "print_blob": False,
}
settings.register_profile("short", derandomize=True, max_examples=20, **COMMON)
settings.register_profile("long", max_examples=int(os.environ.get("HYPOTHESIS_EXAMPLES", "4000")), **COMMON)
settings.load_profile(os.environ.get("HYPOTHESIS_PROFILE", "short"))
