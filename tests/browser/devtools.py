"""A page in a headless Chromium, driven over the DevTools protocol.

The browser is started with a pipe for the protocol, so that nothing but Python itself is needed:
messages are JSON, each with a zero byte behind it.
"""

import base64
import json
import os
import select
import shutil
import subprocess
import tempfile
import time

KEYS = {
    "Enter": ("Enter", 13, "\r"),
    "Escape": ("Escape", 27, ""),
    "ArrowUp": ("ArrowUp", 38, ""),
    "ArrowDown": ("ArrowDown", 40, ""),
    "ArrowLeft": ("ArrowLeft", 37, ""),
    "ArrowRight": ("ArrowRight", 39, ""),
    "Home": ("Home", 36, ""),
    "/": ("Slash", 191, "/"),
}


def browser_path():
    for name in ("chromium", "chromium-browser", "google-chrome", "headless_shell"):
        found = shutil.which(name)
        if found:
            return found
    return None


class Browser:
    def __init__(self, width=1400, height=1000):
        self._profile = tempfile.mkdtemp(prefix="xquery-browser-")
        command_in, self._commands = os.pipe()
        self._answers, answer_out = os.pipe()

        def take_pipes():
            os.dup2(command_in, 3)
            os.dup2(answer_out, 4)
            os.set_inheritable(3, True)
            os.set_inheritable(4, True)

        # The two numbers must be free before they are given out.
        self._process = subprocess.Popen(
            [browser_path(), "--headless=new", "--no-sandbox", "--disable-gpu",
             "--disable-dev-shm-usage", "--no-first-run", "--remote-debugging-pipe",
             "--user-data-dir=" + self._profile, f"--window-size={width},{height}", "about:blank"],
            preexec_fn=take_pipes, close_fds=False,
            stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        os.close(command_in)
        os.close(answer_out)
        self._buffer = b""
        self._number = 0
        self._session = None
        self.events = []
        target = self.send("Target.createTarget", url="about:blank")["targetId"]
        attached = self.send("Target.attachToTarget", targetId=target, flatten=True)
        self._session = attached["sessionId"]
        for domain in ("Page", "Runtime", "Network", "Log"):
            self.send(domain + ".enable")
        self.send("Emulation.setDeviceMetricsOverride", width=width, height=height,
                  deviceScaleFactor=1, mobile=False)

    def close(self):
        self._process.terminate()
        try:
            self._process.wait(10)
        except subprocess.TimeoutExpired:
            self._process.kill()
            self._process.wait()
        os.close(self._commands)
        os.close(self._answers)
        shutil.rmtree(self._profile, ignore_errors=True)

    def _receive(self, deadline):
        while b"\0" not in self._buffer:
            ready, _, _ = select.select([self._answers], [], [], max(0, deadline - time.time()))
            if not ready:
                raise TimeoutError("the browser does not answer")
            data = os.read(self._answers, 1 << 16)
            if not data:
                raise RuntimeError("the browser has ended")
            self._buffer += data
        message, self._buffer = self._buffer.split(b"\0", 1)
        return json.loads(message)

    def send(self, method, **params):
        self._number += 1
        message = {"id": self._number, "method": method, "params": params}
        if self._session:
            message["sessionId"] = self._session
        os.write(self._commands, json.dumps(message).encode() + b"\0")
        deadline = time.time() + 60
        while True:
            answer = self._receive(deadline)
            if answer.get("id") != self._number:
                self.events.append(answer)
                continue
            if "error" in answer:
                raise RuntimeError(f"{method}: {answer['error']}")
            return answer["result"]

    def open(self, path):
        self.events = []
        self.send("Page.navigate", url="file://" + path)
        deadline = time.time() + 60
        while not any(event["method"] == "Page.loadEventFired" for event in self.events):
            self.events.append(self._receive(deadline))
        self.settle()

    def settle(self):
        """Waits until what was asked for has been drawn."""
        self.run("new Promise((done) => requestAnimationFrame(() => setTimeout(done, 30)))")

    def run(self, script):
        """The value of an expression, promises awaited."""
        result = self.send("Runtime.evaluate", expression=script, returnByValue=True,
                           awaitPromise=True)
        if "exceptionDetails" in result:
            raise RuntimeError(json.dumps(result["exceptionDetails"]))
        return result["result"].get("value")

    def key(self, name):
        code, number, text = KEYS[name]
        event = {"key": name, "code": code, "windowsVirtualKeyCode": number}
        self.send("Input.dispatchKeyEvent", type="keyDown" if text else "rawKeyDown", text=text,
                  **event)
        self.send("Input.dispatchKeyEvent", type="keyUp", **event)
        self.settle()

    def type(self, text):
        self.send("Input.insertText", text=text)
        self.settle()

    def _mouse(self, kind, x, y, **more):
        self.send("Input.dispatchMouseEvent", type=kind, x=x, y=y, **more)

    def middle_of(self, selector):
        return self.run(
            f"(() => {{ const r = document.querySelector({json.dumps(selector)})"
            ".getBoundingClientRect(); return [r.left + r.width / 2, r.top + r.height / 2]; })()")

    def point_at(self, selector):
        self._mouse("mouseMoved", *self.middle_of(selector))
        self.settle()

    def click(self, selector):
        x, y = self.middle_of(selector)
        self._mouse("mousePressed", x, y, button="left", clickCount=1)
        self._mouse("mouseReleased", x, y, button="left", clickCount=1)
        self.settle()

    def prefer(self, scheme):
        self.send("Emulation.setEmulatedMedia",
                  features=[{"name": "prefers-color-scheme", "value": scheme}])
        self.settle()

    def screenshot(self, path):
        with open(path, "wb") as file:
            file.write(base64.b64decode(self.send("Page.captureScreenshot")["data"]))

    def problems(self):
        """What went wrong in the page, and what it asked for that is not its own file."""
        found = []
        for event in self.events:
            if event["method"] == "Runtime.exceptionThrown":
                found.append(json.dumps(event["params"]["exceptionDetails"]))
            elif event["method"] == "Log.entryAdded":
                found.append(event["params"]["entry"]["text"])
            elif event["method"] == "Network.requestWillBeSent":
                url = event["params"]["request"]["url"]
                if not url.startswith("file://"):
                    found.append("asked for " + url)
        return found
