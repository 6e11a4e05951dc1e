#!/usr/bin/python3
"""Checks the artwork generator: its meter-scale angles against hand-derived values, and that it reproduces
the committed BMP files and resource script byte for byte. Usage: check-artwork.py GENERATOR ARTWORK_DIR"""
import filecmp
import math
import os
import runpy
import sys
import tempfile
import types
import unittest

GENERATOR, ARTWORK = sys.argv[1], sys.argv[2]
# The generator's functions, without running its command line.
artwork = types.SimpleNamespace(**runpy.run_path(GENERATOR))


class MeterScale(unittest.TestCase):
    # alpha = 180 x 0.3055555522441864 = 54.99999940 degrees; theta = (180 - 2 alpha)(1 - v) + alpha, with
    # v = min(1, 10^(dB/20) x 2.235730360023138), worked out with bc:
    #   -inf: v 0 -> 125.0000006;  -9 dB: v 0.7932670665 -> 69.4713050;  -15 dB: v 0.3975753266 -> 97.1697273;
    #   -25 dB: 116.1992954;  -6 dB: v 1.1205 capped to 1 -> 54.9999994, and so 0 dB and +6 dB too.
    HAND = [(None, 125.0000006), (-25, 116.1992954), (-15, 97.1697273), (-9, 69.4713050),
            (-6, 54.9999994), (0, 54.9999994), (6, 54.9999994)]

    def test_marks_sit_where_the_needle_points(self):
        for db, degrees in self.HAND:
            with self.subTest(db=db):
                self.assertAlmostEqual(math.degrees(artwork.needle_angle(db)), degrees, places=6)


class Reproducible(unittest.TestCase):
    def test_generator_reproduces_the_committed_files(self):
        with tempfile.TemporaryDirectory() as out:
            artwork.main(out)
            made, committed = sorted(os.listdir(out)), sorted(os.listdir(ARTWORK))
            self.assertEqual(made, committed)
            _, mismatch, errors = filecmp.cmpfiles(out, ARTWORK, made, shallow=False)
            self.assertEqual(mismatch + errors, [])


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
