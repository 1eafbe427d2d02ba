"""How queries are compiled and evaluated."""

from __future__ import annotations

import math
import operator
import os
from dataclasses import dataclass, fields
from typing import (
    Any,
    Callable,
    Dict,
    Mapping,
    NamedTuple,
    Optional,
    Protocol,
    Tuple,
    Union,
)

from . import _xquery
from ._xquery import Cancellation, Result


@dataclass(frozen=True)
class Policy:
    """What queries may load: documents, modules, raw bodies and stylesheets.

    Immutable; each method answers a new policy. Without rules any file, http and https URL is
    allowed. A program that evaluates the queries of others begins with ``deny``:

    >>> import xquery
    >>> xquery.Policy.deny().allow_files("/srv/data").allow_urls("https://example.org/public/")
    Policy.deny().allow_files('/srv/data').allow_urls('https://example.org/public/')
    """

    rules: Tuple[Tuple[str, str], ...] = ()

    @classmethod
    def deny(cls) -> Policy:
        """Nothing is allowed, but for what is added."""
        return cls((("deny", ""),))

    def _with(self, name: str, argument: str = "") -> Policy:
        return Policy((*self.rules, (name, argument)))

    def allow_files(self, folder: Union[str, os.PathLike[str]]) -> Policy:
        """Files in that folder, which must exist, and in the folders under it."""
        return self._with("allow_files", os.fspath(folder))

    def allow_urls(self, url: str) -> Policy:
        """What is at or below a URL on a server."""
        return self._with("allow_urls", url)

    def allow_scheme(self, scheme: str) -> Policy:
        """Any URL of that scheme. Others than file, http and https are of use to loaders."""
        return self._with("allow_scheme", scheme)

    def allow_host(self, name: str) -> Policy:
        """From the first one on, of URLs with a host only those of the hosts named.

        ``*.example.org`` stands for every name that ends so.
        """
        return self._with("allow_host", name)

    def forbid_local_addresses(self) -> Policy:
        """Nothing is fetched from servers at addresses that are not of the public network."""
        return self._with("forbid_local_addresses")

    def __repr__(self) -> str:
        rules = self.rules
        calls = [f".{name}({argument!r})" if argument else f".{name}()" for name, argument in rules]
        return "Policy" + ("" if calls and calls[0] == ".deny()" else "()") + "".join(calls)


class Resource(NamedTuple):
    """What a loader answers when bytes alone do not say all."""

    data: Union[bytes, str]
    #: ``text/html`` makes a document an HTML one; without, the path of the URL decides.
    mime_type: Optional[str] = None
    #: Of HTTP: with any other than 200 and 304 there is no resource.
    status: Optional[int] = None
    #: Where redirects ended; information only.
    url: Optional[str] = None


class Loader(Protocol):
    """Fetches in place of the library, for the URLs that the policy allows.

    ``purpose`` is "document", "module", "body" or "stylesheet". None says that there is no such
    resource; an exception ends the evaluation and is raised there. A loader may be called from
    several threads.
    """

    def __call__(self, url: str, purpose: str) -> Union[None, bytes, str, Resource]:
        ...


Modules = Union[Mapping[str, str], Callable[[str], Union[None, bytes, str]]]
Trace = Callable[[str, Result], object]
Missing = Callable[[str, str], object]


@dataclass(frozen=True)
class Settings:
    """The keywords that compile and Context take."""

    seconds: Optional[float] = None
    memory: Optional[int] = None
    policy: Policy = Policy()
    url: Optional[str] = None
    namespaces: Optional[Mapping[str, str]] = None
    cancellation: Optional[Cancellation] = None
    loader: Optional[Loader] = None
    modules: Optional[Modules] = None
    trace: Optional[Trace] = None
    missing: Optional[Missing] = None

    def base(self) -> str:
        """What relative references of a query are resolved against."""
        return _working_folder() if self.url is None else self.url

    def made(self) -> _xquery.Settings:
        """The same for the library."""
        _must_be("policy", Policy, "a Policy", self.policy)
        _must_be("url", (str, type(None)), "a str", self.url)
        _must_be("cancellation", (Cancellation, type(None)), "a Cancellation", self.cancellation)
        base = self.base()
        modules = self.modules
        if isinstance(modules, Mapping):
            modules = _found_in(modules, base)
        return _xquery.Settings(
            seconds=None if self.seconds is None else _seconds(self.seconds),
            memory=None if self.memory is None else _bytes(self.memory),
            policy=self.policy.rules,
            url=base,
            namespaces={} if self.namespaces is None else _namespaces(self.namespaces),
            cancellation=self.cancellation,
            loader=self.loader,
            modules=modules,
            trace=self.trace,
            missing=self.missing,
        )

    def given(self) -> Dict[str, Any]:
        """Those that are not what they are without being given."""
        values = ((field, getattr(self, field.name)) for field in fields(self))
        return {field.name: value for field, value in values if value != field.default}


def _must_be(name: str, types: Any, expected: str, given: object) -> None:
    if not isinstance(given, types):
        raise TypeError(f"{name} must be {expected}, not {type(given).__name__}")


def _seconds(given: float) -> float:
    if not hasattr(given, "__float__") and not hasattr(given, "__index__"):
        raise TypeError(f"seconds must be a number, not {type(given).__name__}")
    try:
        return float(given)
    except OverflowError:
        return math.inf if given > 0 else -math.inf


def _bytes(given: int) -> int:
    if not hasattr(given, "__index__"):
        raise TypeError(f"memory must be an int, not {type(given).__name__}")
    number = operator.index(given)
    if number < 0:
        raise ValueError("memory must not be negative")
    return min(number, 2**64 - 1)


def _namespaces(given: Mapping[str, str]) -> Dict[str, str]:
    _must_be("namespaces", Mapping, "a mapping", given)
    for text in (*given.keys(), *given.values()):
        _must_be("a prefix or a namespace", str, "a str", text)
    for prefix in ("xml", "xmlns"):
        # As a prolog may not, which says so with these words.
        if prefix in given:
            raise ValueError(f"prefix {prefix} can't be redeclared")
    return dict(given)


def _working_folder() -> str:
    try:
        return _xquery.file_url(b"./") or ""
    except OSError:
        return ""


def _found_in(modules: Mapping[str, str], base: str) -> Callable[[str], Optional[str]]:
    return {_xquery.resolve(name, base) or name: text for name, text in modules.items()}.get
