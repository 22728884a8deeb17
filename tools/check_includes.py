#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors
"""Whether includes are what is used. check_includes.py, in the project's folder; prints what is amiss. Exit
status 1 if anything is.

A header that is named gives something: of the standard library one of the names below, of ours a name
that it declares. And a name of the standard library that is used comes from a header that the file
names, or that a header of ours does which the file names.
"""
import os
import re
import subprocess
import sys

# Names after std::, as one regular expression each; size_t comes with any header.
NAMES = {
    "algorithm": r"sort|stable_sort|find|find_\w+|any_of|all_of|none_of|count|count_if|copy|copy_n|copy_if|min|max|clamp"
                 r"|minmax|fill|fill_n|transform|remove|remove_if|reverse|rotate|equal|mismatch|search|lower_bound"
                 r"|upper_bound|equal_range|binary_search|is_sorted|is_sorted_until|unique|max_element|min_element"
                 r"|adjacent_find|for_each|for_each_n|replace|replace_if|partition|partition_point|nth_element|generate"
                 r"|set_difference|lexicographical_compare|is_permutation|includes|shuffle|contains|merge",
    "array": r"array|to_array", "atomic": r"atomic\w*", "bitset": r"bitset",
    "bit": r"bit_\w+|count[lr]_\w+|popcount|endian|has_single_bit|rot[lr]",
    "cctype": r"is(?:alpha|digit|alnum|space|upper|lower|print|xdigit)|to(?:upper|lower)",
    "charconv": r"(?:to|from)_chars\w*|chars_format", "chrono": r"chrono",
    "cmath": r"pow|floor|ceil|l?l?round|sqrt|is(?:nan|inf|finite)|f?abs|log\w*|exp|trunc|nextafter|[lf]r?exp|modf|nearbyint"
             r"|signbit|fmod|cos|sin|rint|fma|cbrt",
    "compare": r"(?:strong|weak|partial)_ordering", "condition_variable": r"condition_variable\w*",
    "concepts": r"same_as|integral|floating_point|convertible_to|invocable|derived_from|(?:un)?signed_integral"
                r"|constructible_from",
    "csignal": r"raise|signal", "cstdarg": r"va_list", "cstddef": r"byte|to_integer|ptrdiff_t|nullptr_t|max_align_t|size_t",
    "cstdint": r"u?int(?:8|16|32|64|ptr|max)_t",
    "cstdio": r"FILE|v?[fs]n?printf|v?printf|fopen|fclose|fwrite|fread|f?puts|fflush|rename|remove|perror|f?putc|putchar"
              r"|fgets|sscanf|fileno",
    "cstdlib": r"getenv|exit|_Exit|abort|[mc]alloc|free|strto\w+|system|atexit|quick_exit|div",
    "cstring": r"mem(?:cpy|set|cmp|chr|move)|str(?:len|n?cmp|error|r?chr|str|signal)",
    "ctime": r"time_t|time|tm|gmtime|strftime|localtime|mktime|timespec", "deque": r"deque",
    "exception": r"exception\w*|terminate|current_exception", "filesystem": r"filesystem", "fstream": r"[io]?fstream",
    "functional": r"function|less|greater|equal_to|invoke|c?ref|plus|minus|hash|reference_wrapper|bind_front|identity|not_fn"
                  r"|multiplies",
    "future": r"(?:shared_)?future\w*|promise|async|launch", "initializer_list": r"initializer_list",
    "iomanip": r"setw|setprecision|setfill", "iostream": r"cout|cerr|cin",
    "iterator": r"\w*inserter|s?size|data|next|prev|distance|advance|begin|end|\w*_iterator\w*|\w+_iterator_tag|empty",
    "limits": r"numeric_limits", "list": r"list", "map": r"(?:multi)?map",
    "memory": r"(?:unique|shared|weak)_ptr|make_(?:unique|shared)\w*|enable_shared_from_this|addressof|to_address"
              r"|construct_at|default_delete|static_pointer_cast",
    "mutex": r"\w*mutex|lock_guard|unique_lock|scoped_lock|call_once|once_flag", "new": r"bad_alloc|nothrow|align_val_t|launder",
    "numbers": r"numbers", "numeric": r"accumulate|iota|reduce|partial_sum|gcd|lcm|midpoint",
    "optional": r"optional|nullopt|make_optional|nullopt_t", "ostream": r"ostream", "random": r"random_device|mt19937\w*|uniform_\w+",
    "ranges": r"ranges|views", "set": r"(?:multi)?set", "span": r"span|as_(?:writable_)?bytes|dynamic_extent",
    "sstream": r"[io]?stringstream", "stdexcept": r"runtime_error|logic_error|invalid_argument|out_of_range",
    "stop_token": r"stop_\w+", "string": r"string|to_string|sto\w+|char_traits|basic_string|getline", "string_view": r"string_view",
    "system_error": r"error_code|system_error|\w+_category|errc", "thread": r"j?thread|this_thread",
    "tuple": r"tuple\w*|tie|make_tuple|forward_as_tuple|ignore|apply",
    "type_traits": r"is_\w+|enable_if\w*|decay_t|remove_(?:c|p|r)\w+|conditional_t|void_t|underlying_type_t"
                   r"|make_(?:un)?signed_t|invoke_result_t|true_type|false_type|common_type_t|type_identity_t|bool_constant",
    "typeinfo": r"type_info", "unordered_map": r"unordered_map", "unordered_set": r"unordered_set",
    "utility": r"move|pair|exchange|swap|forward|as_const|make_pair|\w*index_sequence\w*|in_place\w*|declval|cmp_\w+"
               r"|to_underlying|integer_sequence|in_range|piecewise_construct",
    "variant": r"variant\w*|visit|get_if|holds_alternative|monostate", "vector": r"vector|erase|erase_if",
}
# Names of C that stand without std::.
BARE = {
    "cassert": r"assert\(", "cerrno": r"errno\b|E[A-Z]{2,}\b", "cinttypes": r"PRI\w\d+\b", "climits": r"[A-Z]+_(MAX|MIN|BIT)\b",
    "cmath": r"NAN\b|INFINITY\b", "csignal": r"SIG[A-Z]+\b|sig\w+\(", "cstdarg": r"va_\w+", "cstddef": r"size_t\b",
    "cstdio": r"(FILE|stdout|stderr|stdin|SEEK_\w+|rename(at2?)?|fdopen|dprintf)\b", "cstdlib": r"(un)?setenv\(|mk\w+temp\(|EXIT_",
    "cstring": r"(mem|str)[a-z_]+\(", "ctime": r"(tm|timespec|time_t|CLOCK_\w+|gmtime_r|localtime_r|timegm)\b",
    "new": r"(?:operator )new", "compare": r"auto operator<=>", "initializer_list": r"for \([^:]+: \{",
}
# Names that mean something else without an argument's type; they prove a use, but ask for nothing.
VAGUE = re.compile("size|data|begin|end|empty|remove|rename|abs|move|swap|copy|ignore|hash|erase|time|signal|next|prev|count|"
                   "identity|plus|minus|size_t|contains|apply")

names = subprocess.check_output(["git", "ls-files", "--", "*.cpp", "*.h"], text=True).split()
texts = {}
for name in names:
    with open(name, encoding="utf-8") as text:
        texts[name] = text.read()
code = {name: re.sub(r'//.*|(?<!#include )"(\\.|[^"\\\n])*"', "", text) for name, text in texts.items()}
standard = {name: set(re.findall(r"^#include <(\w+)>", text, re.M)) for name, text in texts.items()}


def ours(name):
    """The includes of ours: as they are written, and the files that they are."""
    for include in re.findall(r'^#include "(.*)"', texts[name], re.M):
        for path in (include, f"NANDInfo/include/{include}", f"{os.path.dirname(name)}/{include}", f"tests/{include}"):
            if path in texts:
                yield include, path


def declares(header):
    """The words after which a name is declared, and those before what may be a declaration's end."""
    body = re.sub(r"^#include.*", "", code[header], flags=re.M)
    found = set(re.findall(r"\b(?:class|struct|enum|using|concept|#define)\b[^;{(=:]*?(\w+)\s*[;{(=:]", body))
    return found | set(re.findall(r"\b(\w+)\s*[(={\[;,]", body))


problems = []
for name, body in code.items():
    words = set(re.findall(r"\w+", re.sub(r"^#include.*", "", body, flags=re.M)))
    used = set(re.findall(r"\bstd::(?:ranges::)?(\w+)", body))
    near = set(standard[name])
    for include, path in ours(name):
        near |= standard[path]
        own = os.path.basename(path)[:-2] == os.path.basename(name).split(".")[0]
        if not own and not declares(path) & words:
            problems.append((name, "-", f'"{include}"'))
    for header in standard[name] & NAMES.keys() | standard[name] & BARE.keys():
        if not any(re.fullmatch(NAMES.get(header, "-"), word) for word in used) and not (
                header in BARE and re.search(rf"\b(?:{BARE[header]})", body)):
            problems.append((name, "-", f"<{header}>"))
    missing = {}
    for word in used:
        homes = [header for header, known in NAMES.items() if re.fullmatch(known, word)]
        if homes and not VAGUE.fullmatch(word) and not near.intersection(homes):
            missing[homes[0]] = word
    problems += [(name, "+", f"<{header}>") for header in missing]

for name, sign, include in sorted(problems):
    print(f"{name}: {include} isn't used" if sign == "-" else f"{name}: uses {include}")
sys.exit(bool(problems))
