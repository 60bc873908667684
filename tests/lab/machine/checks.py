"""unittest's assertions, which say what differed, for functions that are no test cases."""

import unittest

check = unittest.TestCase()
check.maxDiff = None
