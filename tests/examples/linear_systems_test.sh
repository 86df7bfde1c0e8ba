#!/bin/sh
# linear_systems_test.sh program: systems of one equation, of less and of more than a block, and of several blocks are
# solved on every tier, and a bad order gets a message.
set -eu

for order in 1 63 65 200; do
  "$1" $order
done

for order in 0 -3 x 20001; do
  if output=$("$1" $order 2>&1); then status=0; else status=$?; fi
  case "$status $output" in
    "2 usage: "*) echo "order $order: refused" ;;
    *)
      echo "order $order: status $status: $output"
      exit 1
      ;;
  esac
done
