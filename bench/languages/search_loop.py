"""What SearchLoop.cpp does, through the Python module."""
import sys
import time

import qvlocalize

FIRST_PAGE = 20


def search_once(index, text):
    with index.search(text) as result:
        return sum(match.contact_id for match in result[:FIRST_PAGE])


def main():
    texts = sys.argv[2:]
    with qvlocalize.Index(sys.argv[1]) as index:
        for line in sys.stdin:
            begin = time.perf_counter_ns()
            total = sum(search_once(index, texts[i % len(texts)]) for i in range(int(line)))
            print(time.perf_counter_ns() - begin, total, flush=True)


main()
