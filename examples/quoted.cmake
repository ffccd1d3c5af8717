# SPDX-License-Identifier: Apache-2.0

# Fails when README does not hold the example word for word, its licence line apart.
file(READ "${README}" readme)
file(READ "${EXAMPLE}" example)
string(REGEX REPLACE "^(//|#) SPDX-License-Identifier: [^\n]*\n\n?" "" example "${example}")
string(FIND "${readme}" "```cpp\n${example}```" place)
string(FIND "${readme}" "```python\n${example}```" python_place)
if(place EQUAL -1 AND python_place EQUAL -1)
    message(FATAL_ERROR "${README} does not quote ${EXAMPLE} as it stands")
endif()
