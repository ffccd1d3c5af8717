# SPDX-License-Identifier: Apache-2.0

# Installs the package by pip into an empty environment that sees the system's numpy, and runs tests with what stands
# there, nothing of which may come from the build folder: transforms need the library's module, data sets the metadata.
include("${SOURCE}/tests/support/run.cmake")

file(REMOVE_RECURSE "${WORK}")
set(ENV{PYTHONDONTWRITEBYTECODE} 1)
set(ENV{PYTHONSAFEPATH} 1) # a package in the working folder is not looked at
run(${PYTHON} -m venv --system-site-packages --without-pip "${WORK}")
set(python "${WORK}/bin/python")
run(${python} -m pip install --quiet --no-build-isolation --no-index --config-settings folder=${BUILD} "${SOURCE}/python")
set(check "import quo_base, re
maps = open('/proc/self/maps').read()
loaded = [quo_base.__file__] + re.findall(r'/.*/libquo_base.so.*', maps)
assert len(loaded) > 1 and all(file.startswith('${WORK}/') for file in loaded), loaded")
run(${python} -c "${check}")
set(ENV{QUO_TEST_DATA} "${SOURCE}/tests/data")
list(TRANSFORM TESTS PREPEND "${SOURCE}/python/tests/" OUTPUT_VARIABLE files)
run(${python} -m pytest -q -p no:cacheprovider ${files})
file(REMOVE_RECURSE "${WORK}")
