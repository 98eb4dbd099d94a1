# The compiled module: functions that take any objects, check them, and are documented where kel/*.py wraps them.
from typing import Any

version: str

class Prepared:
    """A picture made ready for several registrations, by prepare(). It can be pickled."""

def __getattr__(name: str) -> Any: ...
