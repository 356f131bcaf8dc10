"""The viewer page in Chromium through Selenium; screenshots are left in the work directory."""
import json
import math
import os
import unittest

from selenium import webdriver
from selenium.webdriver.chrome.service import Service
from selenium.webdriver.common.action_chains import ActionChains
from selenium.webdriver.common.actions.wheel_input import ScrollOrigin
from selenium.webdriver.common.by import By
from selenium.webdriver.common.keys import Keys
from selenium.webdriver.support.wait import WebDriverWait

from tool_harness import beats_json, example, path, run, silent_wav

FLAGS = ('--headless', '--no-sandbox', '--disable-gpu', '--disable-quic', '--no-first-run',
         '--disable-background-networking', '--disable-component-update', '--disable-sync',
         '--autoplay-policy=no-user-gesture-required', '--window-size=1200,800')
DRIVER = None


def setUpModule():
    global DRIVER
    options = webdriver.ChromeOptions()
    options.binary_location = '/usr/bin/chromium'
    for flag in FLAGS + ('--user-data-dir=' + path('profile'),):
        options.add_argument(flag)
    options.set_capability('goog:loggingPrefs', {'browser': 'ALL'})
    DRIVER = webdriver.Chrome(service=Service('/usr/bin/chromedriver'), options=options)


def tearDownModule():
    DRIVER.quit()


def page_of(name, seconds, make=example):
    """The path of the page of an example groove (or another input), and its report."""
    audio = make(name + '.wav', seconds=seconds)
    done = run('beats', '-q', audio, '--html', name + '.html')
    assert done.returncode == 0, done.stderr
    return path(name + '.html'), beats_json(audio)[0]


def js(script, *args):
    return DRIVER.execute_script(script, *args)


def open_page(html):
    DRIVER.get('file://' + html)
    DRIVER.get_log('browser')  # only what this page logs counts


def visible_range():
    shown = DRIVER.find_element(By.ID, 'range')
    return float(shown.get_attribute('data-start')), float(shown.get_attribute('data-end'))


def audio_time():
    return js('return document.getElementById("audio").currentTime')


def play_until(seconds):
    """Plays until the audio has reached `seconds`, however slow the machine."""
    play = DRIVER.find_element(By.ID, 'play')
    play.click()
    WebDriverWait(DRIVER, 30, poll_frequency=0.05).until(lambda _: audio_time() >= seconds)
    label = play.text
    play.click()
    return label


class Pages(unittest.TestCase):
    def test_pages_load_draw_play_and_hold_the_reported_beats(self):
        # Fractions of the canvases' pixels drawn on: a flat line for silence.
        for name, make, seconds, largest, ink in (
                ('groove', example, 40, 1_000_000, 0.05),
                ('five-minutes', example, 300, 6_000_000, 0.05),
                # A name that HTML would take for markup.
                ('silence <!--<script>&amp;', lambda n, seconds: silent_wav(n, seconds, 22050), 8,
                 200_000, 0.001),
                ('mono-96k', lambda n, seconds: example(n, 90, 96000, 1, seconds),
                 12, 500_000, 0.05)):
            with self.subTest(name):
                html, report = page_of(name, seconds, make)
                self.assertLessEqual(os.path.getsize(html), largest)
                with open(html, encoding='utf-8') as page:
                    self.assertNotIn('://', page.read())  # nothing fetched from anywhere
                open_page(html)
                data = json.loads(
                    js('return document.getElementById("clipweaver-data").textContent'))
                self.assertEqual(DRIVER.find_element(By.ID, 'file').text, report['file'])
                self.assertEqual(DRIVER.title, report['file'] + ' \N{EM DASH} beats')
                self.assertEqual({key: data[key] for key in report}, report)
                # Both views have drawn something.
                for canvas in ('overview', 'detail'):
                    inked = js('const c = document.getElementById(arguments[0]);'
                               'const d = c.getContext("2d")'
                               '.getImageData(0, 0, c.width, c.height).data;'
                               'let n = 0; for (let i = 3; i < d.length; i += 4) n += d[i] > 0;'
                               'return n / (c.width * c.height);', canvas)
                    self.assertGreater(inked, ink, canvas)
                self.assertAlmostEqual(js('return document.getElementById("audio").duration'),
                                       seconds, delta=0.1)
                self.assertEqual(play_until(1), 'Pause')
                # The label follows the audio's own pause event.
                WebDriverWait(DRIVER, 10).until(
                    lambda _: DRIVER.find_element(By.ID, 'play').text == 'Play')
                DRIVER.save_screenshot(path(name + '.png'))
                self.assertEqual([entry for entry in DRIVER.get_log('browser')
                                  if entry['level'] in ('SEVERE', 'WARNING')], [])


class Controls(unittest.TestCase):
    """Zooming, panning, seeking and the clicks, on the groove (120 BPM, 40 s)."""

    @classmethod
    def setUpClass(cls):
        cls.html, cls.report = page_of('groove', 40)

    def setUp(self):
        open_page(self.html)
        self.detail = DRIVER.find_element(By.ID, 'detail')
        self.assertEqual(visible_range(), (0, 10))

    def tearDown(self):
        self.assertEqual([e for e in DRIVER.get_log('browser') if e['level'] == 'SEVERE'], [])

    def test_zoom_and_pan_move_the_visible_range(self):
        # Zooming keeps the middle (or the point under the wheel) in place;
        # from the start, zooming out and panning left stop at 0. A wheel
        # step of 300 zooms by exp(-0.6).
        wheel = 5 * math.exp(-0.6)
        for control, expected in (('zoom-in', (5 - 10 / 3, 5 + 10 / 3)),
                                  ('+', (5 - 10 / 3, 5 + 10 / 3)),
                                  ('zoom-out', (0, 15)), ('-', (0, 15)),
                                  ('wheel', (5 - wheel, 5 + wheel)),
                                  (Keys.ARROW_RIGHT, (2, 12)), (Keys.ARROW_LEFT, (0, 10))):
            with self.subTest(repr(control)):
                open_page(self.html)
                if control.startswith('zoom'):
                    DRIVER.find_element(By.ID, control).click()
                elif control == 'wheel':
                    ActionChains(DRIVER).scroll_from_origin(ScrollOrigin.from_element(
                        DRIVER.find_element(By.ID, 'detail')), 0, -300).perform()
                else:
                    ActionChains(DRIVER).send_keys(control).perform()
                # The wheel is at the middle pixel, not the middle time.
                for got, want in zip(visible_range(), expected):
                    self.assertAlmostEqual(got, want, delta=0.005)

    def test_a_click_seeks_and_a_drag_pans(self):
        width = self.detail.size['width']
        # Offsets count from the middle of the element.
        ActionChains(DRIVER).move_to_element_with_offset(self.detail, width // 4, 0) \
            .click().perform()
        self.assertAlmostEqual(audio_time(), 7.5, delta=10 / width * 2)
        self.assertEqual(visible_range(), (0, 10))
        ActionChains(DRIVER).move_to_element(self.detail).click_and_hold() \
            .move_by_offset(-width // 4, 0).move_by_offset(-width // 4, 0).release().perform()
        start, end = visible_range()
        self.assertAlmostEqual(start, 5, delta=0.05)
        self.assertAlmostEqual(end - start, 10, delta=0.001)
        self.assertAlmostEqual(audio_time(), 7.5, delta=10 / width * 2)

    def test_the_click_toggle_queues_each_beat_once_and_the_view_follows_the_cursor(self):
        beats = self.report['beats']
        width = self.detail.size['width']
        ActionChains(DRIVER).move_to_element_with_offset(self.detail, width * 45 // 100, 0) \
            .click().perform()
        seeked = audio_time()
        DRIVER.find_element(By.ID, 'clicks').click()
        play_until(seeked + 3)
        stopped = audio_time()
        # The cursor ran off the page at 10 s and the view turned.
        start, end = visible_range()
        self.assertGreater(start, 9)
        self.assertLess(start, stopped)
        self.assertAlmostEqual(end - start, 10, delta=0.001)
        queued = js('return window.clipweaver.scheduledClicks')
        played = [b for b in beats if seeked <= b < stopped]
        self.assertGreater(len(played), 4)
        # Every beat from the seek on, in order, none twice; past the pause
        # at most the next one (beats are 0.5 s apart, the queue 0.3 s long).
        got = [q['beat'] for q in queued]
        first = beats.index(played[0])
        self.assertEqual(got, beats[first:first + len(got)])
        self.assertIn(len(got) - len(played), (0, 1))
        for q in queued:
            self.assertGreaterEqual(q['beat'], q['cursor'])
            self.assertLess(q['beat'] - q['cursor'], 0.31)
