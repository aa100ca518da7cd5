# shellcheck shell=bash
# ./dev lint and ./dev format: how sources, scripts and manual pages look.

lint_packages=(clang-format clang-tidy shellcheck pyflakes3 man-db groff-base)

# sources [FOLDER...]: the C++ sources of the project, or of the folders alone, one a line.
sources() {
    git ls-files --cached --others --exclude-standard -- "$@" | grep -E '\.[ch]pp$'
}

# cmd_lint [FOLDER...]: clang-tidy reads the sources in the folders alone; all else is looked at whole.
cmd_lint() {
    need "${run_packages[@]}" "${test_packages[@]}" "${lint_packages[@]}"
    # What GoogleTest's precompiled headers bring beyond what a test includes would be read with each.
    cmake --preset debug -B build/lint -DMORVANE_TESTS=ON -DCMAKE_DISABLE_PRECOMPILE_HEADERS=ON >/dev/null
    cmake --build build/lint -- --quiet view/view/show/page_template.hpp # a source includes it
    sources | xargs clang-format --dry-run --Werror
    sources "$@" | grep '\.cpp$' | xargs -P "$(nproc)" -n 4 clang-tidy --quiet -p build/lint 2>/dev/null
    shellcheck -x -a dev # with all it sources
    shellcheck .ci/run tests/hardening/check.sh tests/packages/install_and_run
    shellcheck watch/morvane-watch.bash support/supportconfig packaging/debian/*/p* packaging/rpm/*/p*
    shellcheck tests/watch/guest/{build,course}
    shellcheck tests/dist/{build_again,check_program,install_rpms,run_in_clean_root}
    (cd lab/guest && shellcheck -x ../build-guest init course ./*.sh)
    { git ls-files --cached --others --exclude-standard '*.py' && echo watch/morvane-watch tests/watch/guest/run; } | xargs pyflakes3
    lint_manual
    echo "lint: clean"
}

# Whatever man has to say about a manual page is too much.
lint_manual() {
    local page warnings
    for page in {docs,view,watch}/*.[1-8]; do
        warnings=$(LC_ALL=C.UTF-8 MANWIDTH=80 man --warnings --local-file "$page" 2>&1 >/dev/null)
        [ -z "$warnings" ] || { printf '%s\n' "$warnings" >&2; return 1; }
    done
}

cmd_format() {
    need "${lint_packages[@]}"
    sources | xargs clang-format -i
}
