#!/bin/sh
# with-jack.sh JACKD PROGRAM ...: runs a program for two seconds with a sound server that has no sound card.
export JACK_DEFAULT_SERVER="example-$$"
"$1" -r -d dummy -r 48000 -p 256 >/dev/null 2>&1 &
server=$!
trap 'kill $server; wait $server' EXIT
shift
for attempt in 1 2 3 4 5; do
    sleep 1
    sleep 2 | "$@" && exit 0
    echo "attempt $attempt: the server may not be ready"
done
exit 1
