"""What ends the worker that evaluates it."""

import os


def poison(url, purpose):
    os._exit(1)
