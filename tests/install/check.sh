#!/usr/bin/env bash
# check.sh SOURCE_DIR BUILD_DIR cmake|pkg-config|command: installs the build into a new directory
# and uses it from there as a stranger would.
set -eu
source_dir=$1 build_dir=$2 way=$3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake --install "$build_dir" --prefix "$work/prefix" >/dev/null
mkdir "$work/src"
cp "$source_dir/examples/embed.cpp" "$source_dir/examples/embed.c" "$work/src/"
books=$source_dir/examples/books.xml
expected=$'A Field Guide to Lichens\nBrücken & Wege'

case $way in
  cmake)
    cp "$source_dir/tests/install/consumer.cmake" "$work/src/CMakeLists.txt"
    cmake -S "$work/src" -B "$work/build" -G Ninja -DCMAKE_PREFIX_PATH="$work/prefix" >/dev/null
    cmake --build "$work/build" >/dev/null
    actual=$("$work/build/embed" "$books")
    # A program in C needs no C++ of its own.
    mkdir "$work/c"
    cp "$work/src/embed.c" "$work/c/"
    cp "$source_dir/tests/install/consumer_c.cmake" "$work/c/CMakeLists.txt"
    cmake -S "$work/c" -B "$work/build_c" -G Ninja -DCMAKE_PREFIX_PATH="$work/prefix" >/dev/null
    cmake --build "$work/build_c" >/dev/null
    actual_c=$("$work/build_c/embed" "$books")
    ;;
  pkg-config)
    PKG_CONFIG_PATH=$(dirname "$(find "$work/prefix" -name xquery.pc)")
    export PKG_CONFIG_PATH
    # The flags are a list of words.
    # shellcheck disable=SC2046
    g++ -std=c++20 "$work/src/embed.cpp" -o "$work/embed" $(pkg-config --cflags --libs xquery) \
      -Wl,-rpath,"$(pkg-config --variable=libdir xquery)"
    actual=$("$work/embed" "$books")
    # shellcheck disable=SC2046
    gcc -std=c99 -Wall -Wextra -Wpedantic -Werror "$work/src/embed.c" -o "$work/embed_c" \
      $(pkg-config --cflags --libs xquery) -Wl,-rpath,"$(pkg-config --variable=libdir xquery)"
    actual_c=$("$work/embed_c" "$books")
    # This one derives from the classes of the library, with run-time type information.
    # shellcheck disable=SC2046
    g++ -std=c++20 "$source_dir/examples/embedding.cpp" -o "$work/embedding" \
      $(pkg-config --cflags --libs xquery)
    ;;
  command)
    actual=$("$work/prefix/bin/xquery" -e '//book[price > 10]/title/text()' "$books")
    expected=$'A Field Guide to Lichens\nBrücken &amp; Wege'
    # Documents, licence and examples; whatever a document leads to is there as well.
    documents=$(dirname "$(find "$work/prefix/share/doc" -name guide.md -printf '%h')")
    for file in docs/{command,dialect,embedding,errors,functions,guide}.md LICENSE README.md; do
      cmp -s "$source_dir/$file" "$documents/$file" ||
        { echo "$file is not installed" >&2; exit 1; }
    done
    links=0
    for page in "$documents"/*.md "$documents"/docs/*.md; do
      # What stands between fences is no link.
      while read -r link; do
        [ -e "$(dirname "$page")/$link" ] || { echo "$page: $link is missing" >&2; exit 1; }
        links=$((links + 1))
      done < <(sed '/^```/,/^```/d' "$page" | grep -oE '\]\([^)#]+' | sed 's/^](//' |
        grep -v '^https\?:')
    done
    [ "$links" -gt 20 ]
    [ "$(cd "$documents/examples" && "$work/prefix/bin/xquery" --var limit=30 affordable.xq books.xml)" = \
      "$(cd "$source_dir/examples" && "$work/prefix/bin/xquery" --var limit=30 affordable.xq books.xml)" ]
    # The manual page and the completions know every option that the help knows.
    for option in $("$work/prefix/bin/xquery" --help | grep -oE '^ +(-.,)?--[a-z-]+' |
      grep -oE -- '--.*'); do
      for file in man/man1/xquery.1 bash-completion/completions/xquery \
        zsh/site-functions/_xquery fish/vendor_completions.d/xquery.fish; do
        sed 's/\\//g' "$work/prefix/share/$file" | grep -qF -- "${option#--}" ||
          { echo "$file does not name $option" >&2; exit 1; }
      done
    done
    ;;
esac
[ "${actual_c-$actual}" = "$actual" ] || { echo "unexpected output of C: $actual_c" >&2; exit 1; }
[ "$actual" = "$expected" ] || { echo "unexpected output: $actual" >&2; exit 1; }
