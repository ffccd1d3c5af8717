// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_PRELUDE_H
#define QUO_TESTS_SUPPORT_PRELUDE_H

/* What every test may use without a word: the framework, the standard library, files and processes of the system.
 * All of it is compiled once. */

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <complex>
#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <limits>
#include <map>
#include <memory>
#include <numbers>
#include <numeric>
#include <optional>
#include <random>
#include <set>
#include <sstream>
#include <string>
#include <tuple>
#include <typeinfo>
#include <vector>

#endif
