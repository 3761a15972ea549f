#!/usr/bin/env bash
# Builds the Python package into build/python, tests it there, and tries what an installation gives. ./check python
set -euo pipefail
cd "$(dirname "$0")/.."
source Scripts/common.sh

need_packages "${BUILD_PACKAGES[@]}" pybind11-dev python3-dev python3-numpy python3-pytest python3-soundfile \
    python3-distributed python3-matplotlib python3-tqdm mypy sonic-pi-samples
# Debian's Python, whose packages these are, even where another one comes first.
python=/usr/bin/python3
say "building (python)"
# What was configured with another Python would keep that one's headers.
grep -qs "_Python_EXECUTABLE:INTERNAL=$python\$" build/python/CMakeCache.txt || rm -f build/python/CMakeCache.txt
cmake --preset python -DPython_EXECUTABLE=$python >/dev/null
cmake --build --preset python
say "testing (python)"
export PYTHONDONTWRITEBYTECODE=1
PYTHONPATH=$PWD/build/python $python -m pytest -q -p no:cacheprovider Tests/Python

# The blocks of Python in the documentation.
recordings=build/python/recordings
mkdir -p $recordings
cp "$(dpkg -L sonic-pi-samples | grep -m1 '/guit_em9\.')" $recordings/in.flac
PYTHONPATH=$PWD/build/python $python Scripts/doc-blocks.py build/python $recordings --python README.md Docs/python.md

say "installing (python)"
prefix=build/python/installed
rm -rf $prefix build/python/moved
cmake --install build/python --prefix "$PWD/$prefix" >/dev/null
mv $prefix build/python/moved
installed=$(echo "$PWD"/build/python/moved/lib/python3*/*-packages)
PYTHONPATH=$installed $python -c 'import dspdll; assert "moved" in dspdll.__file__'
PYTHONPATH=$installed $python examples/08-python.py
say "to use it: PYTHONPATH=$PWD/build/python $python"
