#!/usr/bin/env bash
# Coverage-guided fuzzing under AddressSanitizer and UndefinedBehaviorSanitizer.
#
#   tools/fuzz.sh [SECONDS] [TARGET...]
#
# Builds the module and the reference engine with clang, instrumented for
# libFuzzer (-fsanitize=fuzzer-no-link,address,undefined), into .venv-fuzz
# (build tree build-fuzz/module), with atheris to drive the Python targets;
# builds the C++ targets with libFuzzer into build-fuzz/. Then runs every
# target for SECONDS (default 600) and fails if any of them crashed.
#
# Targets (tests/fuzz/): raster_serialisation, render_arguments (conversion
# only: the engine probe returns at once), render_arguments-render (tiny real
# renders), segment (C++). Name some to run only those.
#
# FUZZ_JOBS=N runs N targets at once (default 1), at low priority.
# Each run keeps its corpus in build-fuzz/corpus/TARGET (seeded from
# tests/fuzz/corpus/TARGET), its log in build-fuzz/logs/TARGET.log, the
# functions it covered in build-fuzz/logs/TARGET.coverage and any crashing
# input in build-fuzz/artifacts/TARGET/.
set -euo pipefail
cd "$(dirname "$0")/.."
root="$PWD"

seconds="${1:-600}"
[[ $# -gt 0 ]] && shift
all_targets=(raster_serialisation render_arguments render_arguments-render segment)
targets=("$@")
((${#targets[@]})) || targets=("${all_targets[@]}")
jobs="${FUZZ_JOBS:-1}"

# clang 14 and its libFuzzer come with Debian's clang package.
if ! command -v clang++ >/dev/null; then
  apt-get update -qq
  DEBIAN_FRONTEND=noninteractive apt-get install -y -qq clang
fi

mkdir -p build-fuzz/logs
sanitize="-fsanitize=address,undefined -fno-sanitize-recover=undefined -fno-omit-frame-pointer -g"
# atheris's runtime has no C++ part of UBSan (vptr) and knows the function
# check under another name, so those two are left out.
module_flags="-fsanitize=fuzzer-no-link $sanitize -fno-sanitize=vptr,function"

# clang 14 cannot evaluate std::bit_cast of bit-fields at compile time, so the
# engine's compile-time layout checks (never linked) are compiled by g++.
cat > build-fuzz/compile-launcher.sh <<'EOF'
#!/usr/bin/env bash
compiler="$1"; shift
for arg in "$@"; do
  if [[ "$arg" == */layout_checks.cpp ]]; then
    args=()
    for a in "$@"; do [[ "$a" == -fsanitize* || "$a" == -fno-sanitize* ]] || args+=("$a"); done
    exec g++ "${args[@]}"
  fi
done
exec "$compiler" "$@"
EOF
chmod +x build-fuzz/compile-launcher.sh

echo "== building the instrumented module and engine into .venv-fuzz"
[[ -x .venv-fuzz/bin/python ]] || python3 -m venv .venv-fuzz
.venv-fuzz/bin/python -m pip install -q --upgrade pip
.venv-fuzz/bin/python -m pip install -q atheris==3.0.0 swig==4.0.2
CC=clang CXX=clang++ CFLAGS="$module_flags" CXXFLAGS="$module_flags" \
  .venv-fuzz/bin/python -m pip install -q . \
  -C build-dir=build-fuzz/module -C cmake.build-type=RelWithDebInfo \
  -C cmake.define.CMAKE_C_COMPILER=clang -C cmake.define.CMAKE_CXX_COMPILER=clang++ \
  -C cmake.define.CMAKE_CXX_COMPILER_LAUNCHER="$root/build-fuzz/compile-launcher.sh"
site="$(.venv-fuzz/bin/python -c 'import atheris; print(atheris.path())')"

echo "== building the C++ targets into build-fuzz/"
clang++ -std=c++17 -O1 -fsanitize=fuzzer $sanitize -I reference-engine/src \
  tests/fuzz/fuzz_segment.cpp reference-engine/src/ipc/segment.cpp -o build-fuzz/fuzz_segment

# The interpreter is not instrumented: the sanitizers and libFuzzer are
# preloaded (atheris's build of them), the interpreter's allocator is
# bypassed so that object memory is checked too, and leaks are not judged.
python_env=(env "LD_PRELOAD=$site/asan_with_fuzzer.so" PYTHONMALLOC=malloc
            "ASAN_OPTIONS=detect_leaks=0:strict_string_checks=1"
            "UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1"
            "RENDERLIB_FUZZ_HELPERS=$root/build-fuzz/helpers")

command_for() {
  case "$1" in
    raster_serialisation) echo "${python_env[*]} .venv-fuzz/bin/python tests/fuzz/fuzz_raster_serialisation.py" ;;
    render_arguments) echo "${python_env[*]} .venv-fuzz/bin/python tests/fuzz/fuzz_render_arguments.py" ;;
    render_arguments-render) echo "${python_env[*]} .venv-fuzz/bin/python tests/fuzz/fuzz_render_arguments.py --render" ;;
    segment) echo "env ASAN_OPTIONS=detect_leaks=1 UBSAN_OPTIONS=print_stacktrace=1 build-fuzz/fuzz_segment" ;;
    *) echo "unknown target $1 (known: ${all_targets[*]})" >&2; return 1 ;;
  esac
}

# The byte_address helper of the serialisation target, built once by the
# interpreter that runs it (without the preloaded runtimes).
RENDERLIB_FUZZ_HELPERS="$root/build-fuzz/helpers" .venv-fuzz/bin/python -c \
  "import sys; sys.path.insert(0, 'tests/fuzz'); import fuzz_common; fuzz_common.byte_address_module()"

run_target() {
  local target="$1" command
  command="$(command_for "$target")"
  local corpus="build-fuzz/corpus/$target" artifacts="build-fuzz/artifacts/$target/"
  local log="build-fuzz/logs/$target.log"
  rm -rf "$artifacts"  # a crash of an earlier run is in its log
  mkdir -p "$corpus" "$artifacts"
  local seeds=()
  [[ -d "tests/fuzz/corpus/$target" ]] && seeds=("tests/fuzz/corpus/$target")
  local status=0
  # shellcheck disable=SC2086
  nice -n 10 $command -max_total_time="$seconds" -timeout=60 -rss_limit_mb=6144 -print_final_stats=1 \
    -artifact_prefix="$artifacts" "$corpus" "${seeds[@]}" >"$log" 2>&1 || status=$?
  # The functions the corpus reaches, with their edges covered.
  # shellcheck disable=SC2086
  $command -runs=0 -print_coverage=1 -artifact_prefix="build-fuzz/logs/$target.replay-" "$corpus" 2>&1 | grep '^COVERED_FUNC' >"build-fuzz/logs/$target.coverage" || true
  echo "$status" >"build-fuzz/logs/$target.status"
}

echo "== fuzzing ${targets[*]} for $seconds s each, $jobs at a time"
running=0
for target in "${targets[@]}"; do
  command_for "$target" >/dev/null
  run_target "$target" &
  running=$((running + 1))
  if ((running >= jobs)); then
    wait -n || true
    running=$((running - 1))
  fi
done
wait || true

failed=0
printf '\n%-26s %8s %12s %8s %8s %s\n' target status executions cov ft result
for target in "${targets[@]}"; do
  log="build-fuzz/logs/$target.log"
  status="$(cat "build-fuzz/logs/$target.status")"
  executions="$(sed -n 's/^stat::number_of_executed_units: *//p' "$log" | tail -1)"
  last="$(grep -E '^#[0-9]+' "$log" | grep -E 'cov: ' | tail -1 || true)"
  cov="$(sed -n 's/.*cov: \([0-9]*\).*/\1/p' <<<"$last")"
  ft="$(sed -n 's/.*ft: \([0-9]*\).*/\1/p' <<<"$last")"
  crashes="$(find "build-fuzz/artifacts/$target" -type f | wc -l)"
  result=ok
  if [[ "$status" != 0 || "$crashes" != 0 ]]; then
    result="CRASH (see $log and build-fuzz/artifacts/$target/)"
    failed=1
  fi
  printf '%-26s %8s %12s %8s %8s %s\n' "$target" "$status" "${executions:-?}" "${cov:-?}" "${ft:-?}" "$result"
done
exit "$failed"
