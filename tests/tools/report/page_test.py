#!/usr/bin/env python3
"""Opens a page of the report in headless Chromium: it plays, it shows, it reads, it asks nobody.

usage: page_test.py DIR     DIR/index.html is the sample page

Exits with 77 where there is no browser to test in; with TESSALY_NEED_BROWSER set that is a failure.
"""

import json
import os
import pathlib
import shutil
import sys
import tempfile
import time
import unittest

SKIPPED = 77
HOSTILE = "\"><script>alert('x')</script><b a='&amp;"
WIDTHS = (360, 390, 768, 1280)
SWITCHES = (
    "--headless=new --no-sandbox --disable-gpu --disable-quic --no-first-run "
    "--disable-background-networking --disable-component-update --disable-sync --mute-audio"
).split()

# Text that is seen: its element, its box, its size in pixels of the display.
VISIBLE_TEXT = """
    const seen = [];
    const walker = document.createTreeWalker(document.body, NodeFilter.SHOW_TEXT);
    for (let node; (node = walker.nextNode());) {
        const element = node.parentElement;
        if (!node.data.trim() || element.closest("script,style,audio,.unseen,.skip")
            || !element.checkVisibility({visibilityProperty: true})) continue;
        const range = document.createRange();
        range.selectNodeContents(node);
        const box = range.getBoundingClientRect();
        if (box.width === 0) continue;
        const inDrawing = element.closest("svg") !== null;
        const scale = inDrawing ? element.getScreenCTM().a : 1;
        seen.push({element, box, text: node.data.trim(), inDrawing,
                   size: scale * parseFloat(getComputedStyle(element).fontSize)});
    }
"""

# Luminance by the rule for contrast; any CSS colour is painted to learn its parts.
CONTRAST = """
    const paint = document.createElement("canvas").getContext("2d", {willReadFrequently: true});
    const parts = (colour) => {
        paint.clearRect(0, 0, 1, 1);
        paint.fillStyle = colour;
        paint.fillRect(0, 0, 1, 1);
        return [...paint.getImageData(0, 0, 1, 1).data];
    };
    const luminance = (colour) => {
        const [r, g, b] = parts(colour).map((part) => part / 255)
            .map((part) => part <= 0.04045 ? part / 12.92 : ((part + 0.055) / 1.055) ** 2.4);
        return 0.2126 * r + 0.7152 * g + 0.0722 * b;
    };
    const contrast = (one, other) => {
        const [dark, bright] = [luminance(one), luminance(other)].sort((a, b) => a - b);
        return (bright + 0.05) / (dark + 0.05);
    };
    const behind = (element) => {
        const circle = element.closest(".mark")?.querySelector("circle");
        if (circle) return getComputedStyle(circle).fill;
        for (let one = element; one; one = one.parentElement) {
            const colour = getComputedStyle(one).backgroundColor;
            if (parts(colour)[3] === 255) return colour;
        }
        return "white";
    };
"""


def start_browser(profile):
    from selenium import webdriver
    from selenium.webdriver.chrome.service import Service

    options = webdriver.ChromeOptions()
    options.binary_location = shutil.which("chromium")
    for switch in SWITCHES + [f"--user-data-dir={profile}"]:
        options.add_argument(switch)
    options.set_capability("goog:loggingPrefs", {"browser": "ALL", "performance": "ALL"})
    return webdriver.Chrome(service=Service(shutil.which("chromedriver")), options=options)


def setUpModule():
    profile = tempfile.TemporaryDirectory(ignore_cleanup_errors=True)
    unittest.addModuleCleanup(profile.cleanup)
    Page.browser = start_browser(profile.name)
    unittest.addModuleCleanup(Page.browser.quit)
    Page.browser.set_script_timeout(20)


class Page(unittest.TestCase):
    address = ""
    browser = None

    def load(self):
        self.browser.get("about:blank")  # an address with a fragment alone would load nothing
        self.browser.get(self.address)

    def tearDown(self):
        self.assertEqual(self.browser.get_log("browser"), [], "the console is not empty")

    def show(self, width, scheme="light"):
        self.browser.execute_cdp_cmd(
            "Emulation.setDeviceMetricsOverride",
            {"width": width, "height": 800, "deviceScaleFactor": 1, "mobile": False},
        )
        self.browser.execute_cdp_cmd(
            "Emulation.setEmulatedMedia",
            {"features": [
                {"name": "prefers-color-scheme", "value": scheme},
                {"name": "prefers-reduced-motion", "value": "reduce"},
            ]},
        )

    def run_script(self, script, *arguments):
        return self.browser.execute_script(script, *arguments)

    def wait_for(self, condition, what, seconds=10):
        end = time.monotonic() + seconds
        while not condition():
            self.assertLess(time.monotonic(), end, f"waited in vain: {what}")
            time.sleep(0.02)

    def press(self, key):
        from selenium.webdriver import ActionChains

        ActionChains(self.browser, duration=0).send_keys(key).perform()

    def find(self, selector):
        return self.browser.find_elements("css selector", selector)

    def audio_state(self, index):
        return self.run_script(
            """const audio = document.querySelectorAll("audio")[arguments[0]];
            return {time: audio.currentTime, paused: audio.paused, ready: audio.readyState,
                    duration: audio.duration, error: audio.error && audio.error.message};""",
            index,
        )

    def wait_for_players(self):
        count = len(self.find("audio"))
        self.wait_for(
            lambda: all(self.audio_state(i)["ready"] >= 2 for i in range(count)), "players load"
        )
        return count


class PageAsItStands(Page):
    """What is true of the page before anyone touches it; one load for all."""

    def setUp(self):
        self.show(1280)
        if self.browser.current_url != self.address:
            self.load()

    def test_players_hold_the_sound_of_their_graphs(self):
        count = self.wait_for_players()
        self.assertEqual(count, len(self.find("section.entry")))
        for index in range(count):
            state = self.audio_state(index)
            seconds = self.run_script(
                """return [...document.querySelectorAll("section.entry")[arguments[0]]
                    .querySelectorAll("[data-seconds]")].map((one) => Number(one.dataset.seconds));""",
                index,
            )
            self.assertIsNone(state["error"])
            self.assertEqual(len(seconds), 5)
            for one in seconds:
                self.assertAlmostEqual(state["duration"], one, delta=0.001)

    def test_sounds_decode_to_the_end_with_both_ears(self):
        decoded = self.browser.execute_async_script(
            """const done = arguments[0];
            const decode = async (audio) => {
                const bytes = atob(audio.src.slice(audio.src.indexOf(",") + 1));
                const buffer = Uint8Array.from(bytes, (one) => one.charCodeAt(0)).buffer;
                const sound = await new OfflineAudioContext(2, 1, 48000).decodeAudioData(buffer);
                const peaks = [0, 1].map((ear) =>
                    sound.getChannelData(ear).reduce((peak, one) => Math.max(peak, Math.abs(one)), 0));
                return {seconds: sound.duration, channels: sound.numberOfChannels, peaks};
            };
            Promise.all([...document.querySelectorAll("audio")].map(decode))
                .then(done, (failure) => done(String(failure)));"""
        )
        self.assertIsInstance(decoded, list, decoded)
        for sound, seconds in zip(decoded, (6.0, 5.0, 0.4), strict=True):
            self.assertAlmostEqual(sound["seconds"], seconds, delta=0.001)
            self.assertEqual(sound["channels"], 2)
            self.assertGreater(min(sound["peaks"]), 0.02)

    def test_pictures_have_content(self):
        colours = self.run_script(
            """return [...document.images].map((image) => {
                const canvas = document.createElement("canvas");
                canvas.width = image.naturalWidth;
                canvas.height = image.naturalHeight;
                const pen = canvas.getContext("2d");
                pen.drawImage(image, 0, 0);
                const pixels = new Uint32Array(
                    pen.getImageData(0, 0, canvas.width, canvas.height).data.buffer);
                return [canvas.width, canvas.height, new Set(pixels).size];
            });"""
        )
        self.assertEqual(len(colours), 6)
        for width, height, different in colours:
            self.assertGreaterEqual(width, 100)
            self.assertGreaterEqual(height, 200)
            self.assertGreater(different, 100)
        drawings = self.run_script(
            """return [...document.querySelectorAll("svg")].map((svg) => {
                const box = svg.getBBox();
                const lines = svg.querySelectorAll("polyline").length;
                return [box.width, box.height, svg.querySelectorAll("*").length, lines,
                        svg.parentElement.getAttribute("aria-label")];
            });"""
        )
        self.assertGreaterEqual(len(drawings), 17)
        for width, height, shapes, _, name in drawings:
            self.assertGreater(width, 20, name)
            self.assertGreater(height, 20, name)
            self.assertGreater(shapes, 3, name)
        curves = self.run_script(
            """return [...document.querySelectorAll(".plot")].filter((plot) =>
                plot.querySelector("svg") && !plot.querySelector("polyline"))
                .map((plot) => plot.ariaLabel);"""
        )
        self.assertEqual(curves, [])

    def test_page_is_never_wider_than_the_display(self):
        self.run_script('for (const one of document.querySelectorAll("details")) one.open = true')
        for width in WIDTHS:
            with self.subTest(width=width):
                self.show(width)
                wide, beyond = self.run_script(
                    """const beyond = [...document.body.querySelectorAll("*")].filter((one) =>
                        !one.closest(".wide table,.unseen,.skip,svg")
                        && one.getBoundingClientRect().right > innerWidth + 0.5)
                        .map((one) => one.outerHTML.slice(0, 80));
                    return [document.documentElement.scrollWidth, beyond];"""
                )
                self.assertLessEqual(wide, width)
                self.assertEqual(beyond, [])

    def test_content_stays_within_its_card(self):
        self.run_script('for (const one of document.querySelectorAll("details")) one.open = true')
        for width in WIDTHS:
            with self.subTest(width=width):
                self.show(width)
                outside = self.run_script(
                    """return [...document.querySelectorAll("table,figure,.map")].filter((one) => {
                        const card = one.closest(".entry");
                        const edge = card.getBoundingClientRect().right
                            - parseFloat(getComputedStyle(card).paddingRight);
                        return one.getBoundingClientRect().right > edge + 1.5
                            && !one.closest(".wide");
                    }).map((one) => one.outerHTML.slice(0, 80));"""
                )
                self.assertEqual(outside, [])

    def test_text_is_large_enough_on_every_display(self):
        for width in WIDTHS:
            with self.subTest(width=width):
                self.show(width)
                texts = self.run_script(
                    VISIBLE_TEXT + "return seen.map((one) => [one.text, one.size]);"
                )
                self.assertGreater(len(texts), 200)
                self.assertTrue(any(text == "metres" for text, _ in texts))
                self.assertEqual([one for one in texts if one[1] < 11.0], [])

    def test_labels_of_ticks_do_not_touch(self):
        for width in WIDTHS:
            with self.subTest(width=width):
                self.show(width)
                touching = self.run_script(
                    """const touching = [];
                    for (const plot of document.querySelectorAll(".plot")) {
                        const boxes = [...plot.querySelectorAll(".x,.y")]
                            .filter((one) => getComputedStyle(one).visibility === "visible")
                            .map((one) => ({text: one.textContent, box: one.getBoundingClientRect()}));
                        boxes.forEach((one, i) => boxes.slice(i + 1).forEach((other) => {
                            const a = one.box, b = other.box;
                            if (a.left < b.right && b.left < a.right && a.top < b.bottom
                                && b.top < a.bottom)
                                touching.push([plot.ariaLabel.slice(0, 30), one.text, other.text]);
                        }));
                    }
                    return touching;"""
                )
                self.assertEqual(touching, [])

    def test_text_and_curves_stand_out_in_both_schemes(self):
        backgrounds = set()
        for scheme in ("light", "dark"):
            with self.subTest(scheme=scheme):
                self.show(1280, scheme)
                weak, count = self.run_script(
                    VISIBLE_TEXT + CONTRAST + """
                    const weak = seen.map(({element, text, inDrawing}) => {
                        const style = getComputedStyle(element);
                        return [text, contrast(inDrawing ? style.fill : style.color,
                                               behind(element))];
                    });
                    return [weak.filter((one) => one[1] < 4.5), weak.length];"""
                )
                self.assertGreater(count, 200)
                self.assertEqual(weak, [])
                lines = self.run_script(
                    CONTRAST + """
                    return [...document.querySelectorAll(".plot polyline")].map((line) =>
                        contrast(getComputedStyle(line).stroke, behind(line.closest(".plot"))));"""
                )
                self.assertGreater(len(lines), 10)
                self.assertGreater(min(lines), 3.0)
                backgrounds.add(self.run_script("return getComputedStyle(document.body).backgroundColor"))
        self.assertEqual(len(backgrounds), 2)

    def test_structure_can_be_followed_without_seeing_it(self):
        self.assertEqual(self.run_script("return document.documentElement.lang"), "en")
        self.assertEqual(self.browser.title, "Sample report")
        for landmark in ("main", "header", "nav"):
            self.assertEqual(len(self.find(landmark)), 1, landmark)
        ids = [one.get_attribute("id") for one in self.find("[id]")]
        self.assertEqual(len(ids), len(set(ids)))
        for reference in ("aria-labelledby", "aria-describedby"):
            for element in self.find(f"[{reference}]"):
                self.assertIn(element.get_attribute(reference), ids)
        levels = self.run_script(
            """return [...document.querySelectorAll("h1,h2,h3,h4,h5,h6")]
                .map((one) => Number(one.tagName[1]));"""
        )
        self.assertEqual(levels[0], 1)
        self.assertEqual(levels.count(1), 1)
        for above, level in zip(levels, levels[1:]):
            self.assertLessEqual(level, above + 1)
        for picture in self.find("[role=img]"):
            self.assertRegex(picture.get_attribute("aria-label"), r"\w+ .*[0-9].*\.")
        nameless = self.run_script(
            """return [...document.querySelectorAll("img,svg")].filter((one) =>
                !one.closest("[role=img]")).length;"""
        )
        self.assertEqual(nameless, 0)
        for player in self.find("audio"):
            self.assertTrue(player.get_attribute("aria-label").startswith("Sound: "))

    def test_names_are_shown_as_they_are(self):
        section = self.find("section.entry")[2]
        self.assertEqual(section.find_element("css selector", "h2").text, HOSTILE)
        self.assertEqual(section.find_element("css selector", ".remarks li").text, HOSTILE)
        self.assertEqual(section.find_element("css selector", ".sources li").text, HOSTILE)
        self.assertEqual(len(self.find("b")), 0)
        self.assertEqual(len(self.find("script")), 1)


class PageInUse(Page):
    """What happens when it is used; each from a fresh page."""

    def setUp(self):
        self.show(1280)
        self.load()

    def test_keyboard_plays_seeks_and_moves_the_playheads(self):
        from selenium.webdriver.common.keys import Keys

        self.wait_for_players()
        self.run_script('document.querySelector("audio").focus()')
        heads = lambda: self.run_script(
            """return [...document.querySelector("section.entry").querySelectorAll(".playhead")]
                .map((head) => [getComputedStyle(head).visibility, parseFloat(head.style.left)]);"""
        )
        self.assertEqual({visibility for visibility, _ in heads()}, {"hidden"})
        self.press(Keys.SPACE)
        self.wait_for(lambda: self.audio_state(0)["time"] > 0.25, "the sound plays")
        self.assertFalse(self.audio_state(0)["paused"])
        shown = heads()
        self.assertEqual(len(shown), 5)
        for visibility, place in shown:
            self.assertEqual(visibility, "visible")
            self.assertGreater(place, 2.0)
        self.press(Keys.SPACE)
        self.wait_for(lambda: self.audio_state(0)["paused"], "the sound pauses")
        before = self.audio_state(0)["time"]
        for visibility, place in heads():
            self.assertAlmostEqual(place, 100.0 * before / 6.0, delta=0.5)
        self.press(Keys.ARROW_RIGHT)
        self.wait_for(lambda: self.audio_state(0)["time"] > before, "the arrow seeks")

    def test_one_sound_plays_at_a_time(self):
        from selenium.webdriver.common.keys import Keys

        self.wait_for_players()
        for index in range(2):
            self.run_script('document.querySelectorAll("audio")[arguments[0]].focus()', index)
            self.press(Keys.SPACE)
            self.wait_for(lambda: not self.audio_state(index)["paused"], "the sound plays")
        self.wait_for(lambda: self.audio_state(0)["paused"], "the first sound stops")
        self.assertFalse(self.audio_state(1)["paused"])

    def test_clicking_a_graph_seeks_and_moves_the_marks(self):
        from selenium.webdriver import ActionChains

        self.wait_for_players()
        before = self.find(".mark")[1].get_attribute("transform")
        for index in range(5):
            place = 0.25 + 0.1 * index
            plot = self.find("section.entry:first-of-type .plot[data-seconds]")[index]
            self.run_script('arguments[0].scrollIntoView({block: "center"})', plot)
            width = plot.size["width"]
            ActionChains(self.browser, duration=0).move_to_element_with_offset(
                plot, round((place - 0.5) * width), 0
            ).click().perform()
            self.assertAlmostEqual(self.audio_state(0)["time"], 6.0 * place, delta=0.03)
        self.assertNotEqual(self.find(".mark")[1].get_attribute("transform"), before)

    def test_marks_stand_where_the_source_is(self):
        # The string starts ahead and is at the right after a quarter of its way.
        self.wait_for_players()
        self.run_script('document.querySelector("audio").currentTime = 1.5')
        middle_x, middle_y, x, y = self.browser.execute_async_script(
            """const done = arguments[0];
            setTimeout(() => done([...document.querySelectorAll("section.entry:first-of-type .mark")]
                .flatMap((mark) => {
                    const at = mark.transform.baseVal.getItem(0).matrix;
                    return [at.e, at.f];
                })), 200);"""
        )
        self.assertGreater(x, middle_x + 100)
        self.assertAlmostEqual(y, middle_y, delta=3)

    def test_nothing_is_asked_of_a_network(self):
        self.browser.get_log("performance")
        self.browser.get(self.address)
        self.wait_for_players()
        text = (pathlib.Path(self.address.removeprefix("file://"))).read_text()
        for scheme in ("http:", "https:", "//cdn", "url(http", "@import"):
            self.assertNotIn(scheme, text)
        entries = self.run_script('return performance.getEntriesByType("resource").map((e) => e.name)')
        for name in entries:
            self.assertTrue(name.startswith("data:"), name[:80])
        asked = 0
        for line in self.browser.get_log("performance"):
            message = json.loads(line["message"])["message"]
            if message["method"] == "Network.requestWillBeSent":
                address = message["params"]["request"]["url"]
                self.assertRegex(address[:80], r"^(file:|data:)")
                asked += 1
        self.assertGreater(asked, 0)

    def test_links_of_the_contents_lead_to_their_sections(self):
        links = self.find("nav a")
        titles = [one.text for one in self.find("section.entry > h2")]
        self.assertEqual([link.text for link in links], titles)
        for index, link in enumerate(links):
            link.click()
            top, bottom = self.run_script(
                """const box = document.querySelector(":target > h2").getBoundingClientRect();
                return [box.top, box.bottom];"""
            )
            self.assertGreaterEqual(top, 0)
            self.assertLess(bottom, 800)
            self.assertEqual(
                self.run_script('return document.querySelector(":target > h2").textContent'),
                titles[index],
            )
            self.run_script("scrollTo(0, 0)")

    def test_everything_is_reached_with_the_tab_key(self):
        from selenium.webdriver.common.keys import Keys

        wanted = self.run_script(
            """const all = [...document.querySelectorAll("a[href],audio,summary")];
            all.forEach((one, index) => one.wantedIndex = index);
            return all.length;"""
        )
        self.assertGreaterEqual(wanted, 10)
        reached = {}
        for _ in range(60):
            self.press(Keys.TAB)
            index, outline = self.run_script(
                """const style = getComputedStyle(document.activeElement);
                return [document.activeElement.wantedIndex ?? -1,
                        document.activeElement.tagName === "AUDIO" || style.outlineStyle !== "none"
                            && parseFloat(style.outlineWidth) >= 2];"""
            )
            reached[index] = outline
            if len(reached.keys() - {-1}) == wanted:
                break
        self.assertEqual(sorted(reached.keys() - {-1}), list(range(wanted)))
        self.assertTrue(all(outline for index, outline in reached.items() if index >= 0))

    def test_skip_link_and_parameters_open_with_the_keyboard(self):
        from selenium.webdriver.common.keys import Keys

        self.press(Keys.TAB)
        self.assertEqual(
            self.run_script("return document.activeElement.className"), "skip"
        )
        self.assertGreaterEqual(
            self.run_script("return document.activeElement.getBoundingClientRect().top"), 0
        )
        self.press(Keys.ENTER)
        self.assertEqual(self.run_script("return document.activeElement.tagName"), "MAIN")
        self.run_script('document.querySelector("summary").focus()')
        self.press(Keys.ENTER)
        self.assertTrue(self.run_script('return document.querySelector("details").open'))
        self.assertTrue(self.find("details td")[0].is_displayed())

    def test_paper_shows_all_parameters(self):
        self.run_script('dispatchEvent(new Event("beforeprint"))')
        self.assertTrue(
            self.run_script('return [...document.querySelectorAll("details")].every((d) => d.open)')
        )


def missing():
    if shutil.which("chromium") is None or shutil.which("chromedriver") is None:
        return "chromium or chromedriver is not installed"
    try:
        import selenium  # noqa: F401
    except ImportError:
        return "this Python has no selenium"
    return None


def main():
    if len(sys.argv) != 2:
        print(__doc__, file=sys.stderr)
        return 2
    reason = missing()
    if reason is not None:
        print(f"page_test: {reason}", file=sys.stderr)
        return 1 if os.environ.get("TESSALY_NEED_BROWSER") else SKIPPED
    Page.address = (pathlib.Path(sys.argv[1]).resolve() / "index.html").as_uri()
    return 0 if unittest.main(argv=sys.argv[:1], exit=False).result.wasSuccessful() else 1


if __name__ == "__main__":
    sys.exit(main())
