#!/bin/sh
# Compares all results with what is expected, and says which tolerance would do for those that
# differ.
digits=${DIGITS:-10}
status=0
talcmp --tol "$digits" expected results >comparison.txt || status=$?
case $status in
0) echo "all results are as expected" ;;
1) talcmp --tol "$digits" --report expected results | sed -n '/differ:/,/smallest tolerance/p' ;;
*) echo "some results could not be compared" >&2 ;;
esac
exit "$status"
