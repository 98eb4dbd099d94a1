"""--fuzz-calls N: how many random calls test_fuzz makes."""


def pytest_addoption(parser):
    parser.addoption("--fuzz-calls", type=int, default=4000)
