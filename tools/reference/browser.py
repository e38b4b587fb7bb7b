"""A headless Chromium, driven through chromedriver by the WebDriver protocol."""

import base64
import json
import re
import subprocess
import urllib.request

START = 180  # seconds that a loaded machine may take

ARGUMENTS = ["--headless=new", "--disable-gpu", "--hide-scrollbars", "--disable-dev-shm-usage",
             "--no-sandbox"]  # the sandbox refuses to run as root

KEYS = {"Enter": "\ue007", "Escape": "\ue00c", "ArrowDown": "\ue015", "ArrowUp": "\ue013", "Tab": "\ue004"}


class Browser:
    def __init__(self):
        self.driver = subprocess.Popen(["chromedriver", "--port=0"], stdout=subprocess.PIPE, text=True)
        # To this machine, whatever proxy the environment names.
        self.opener = urllib.request.build_opener(urllib.request.ProxyHandler({}))
        try:
            port = next(match[1] for line in self.driver.stdout if (match := re.search(r"successfully on port (\d+)", line)))
            self.root = f"http://127.0.0.1:{port}/session"
            options = {"args": ARGUMENTS}
            asked = {"browserName": "chrome", "goog:chromeOptions": options, "goog:loggingPrefs": {"browser": "ALL"}}
            self.root += "/" + self.post("", capabilities={"alwaysMatch": asked})["sessionId"]
            self.post("/timeouts", script=1000 * START, pageLoad=1000 * START)
        except BaseException:
            self.end_driver()
            raise

    def close(self):
        self.request("DELETE", "")
        self.end_driver()

    def end_driver(self):
        self.driver.terminate()
        self.driver.communicate()

    def request(self, method, path, body=None):
        data = json.dumps(body).encode() if method == "POST" else None
        request = urllib.request.Request(self.root + path, data, {"Content-Type": "application/json"}, method=method)
        with self.opener.open(request, timeout=START) as answer:
            return json.load(answer)["value"]

    def post(self, path, **body):
        return self.request("POST", path, body)

    def open(self, address):
        self.post("/url", url="about:blank")  # else another part behind # would load nothing anew
        self.post("/url", url=address)

    def run(self, script, *arguments):
        return self.post("/execute/sync", script=script, args=list(arguments))

    def press(self, *keys):
        """Presses keys, by name or as text of several."""
        typed = [KEYS[key] if key in KEYS else letter for key in keys for letter in ([key] if key in KEYS else key)]
        actions = [{"type": kind, "value": key} for key in typed for kind in ("keyDown", "keyUp")]
        self.post("/actions", actions=[{"type": "key", "id": "keyboard", "actions": actions}])

    def resize(self, width, height, scale=1):
        self.post("/goog/cdp/execute", cmd="Emulation.setDeviceMetricsOverride", params={
            "width": width, "height": height, "deviceScaleFactor": scale, "mobile": width < 500})

    def prefer(self, scheme):
        self.post("/goog/cdp/execute", cmd="Emulation.setEmulatedMedia",
                  params={"features": [{"name": "prefers-color-scheme", "value": scheme}]})

    def errors(self):
        """What the console was told since this was last asked, but for mere information."""
        return [entry["message"] for entry in self.post("/se/log", type="browser") if entry["level"] in ("SEVERE", "WARNING")]

    def picture(self):
        return base64.b64decode(self.request("GET", "/screenshot"))
