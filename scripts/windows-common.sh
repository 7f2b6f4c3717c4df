# What the commands for Windows have in common. Sourced after common.sh.

windows_libraries=$project_dir/build/windows-libraries

# Installs what scripts/packages-windows.txt, scripts/packages.txt and the arguments name.
install_windows_packages() {
    local packages
    mapfile -t packages < <(grep -vE '^[[:space:]]*(#|$)' "$project_dir/scripts/packages-windows.txt")
    install_packages "${packages[@]}" "$@"
}

# Builds and installs a CMake project for Windows below ROOT: cross_build ROOT NAME SOURCE [OPTION...]
cross_build() {
    local root=$1 name=$2 source=$3 launcher=()
    shift 3
    if command -v ccache >/dev/null; then
        launcher=(-DCMAKE_C_COMPILER_LAUNCHER=ccache -DCMAKE_CXX_COMPILER_LAUNCHER=ccache)
    fi
    cmake -S "$source" -B "$root/build/$name" -G Ninja \
        --toolchain "$project_dir/cmake/windows/mingw.cmake" \
        -DCMAKE_INSTALL_PREFIX="$root" -DCMAKE_BUILD_TYPE=Release "${launcher[@]}" "$@" &&
        cmake --build "$root/build/$name" --target install
}

# Unpacks a Debian source package into ROOT/source/NAME, once: fetch_source ROOT NAME PACKAGE
# The machine's own package sources, with source packages, are read from a folder of their own; the
# machine's lists stay as they are.
fetch_source() {
    local root=$1 name=$2 package=$3 apt=$1/apt options
    if [[ -d $root/source/$name ]]; then return; fi
    mkdir -p "$apt/parts" "$apt/lists/partial" "$apt/cache/archives/partial" "$root/source"
    : >"$apt/sources.list"
    if [[ -f /etc/apt/sources.list ]]; then
        sed -E 's/^deb /deb-src /' /etc/apt/sources.list >"$apt/sources.list"
    fi
    find /etc/apt/sources.list.d -name '*.sources' -exec cp -t "$apt/parts" {} +
    find /etc/apt/sources.list.d -name '*.list' -exec cp -t "$apt/parts" {} +
    find "$apt/parts" -name '*.sources' -exec sed -i -E 's/^Types:.*/Types: deb-src/' {} +
    find "$apt/parts" -name '*.list' -exec sed -i -E 's/^deb /deb-src /' {} +
    options=(-o "Dir::Etc::sourcelist=$apt/sources.list" -o "Dir::Etc::sourceparts=$apt/parts"
        -o "Dir::State::lists=$apt/lists" -o "Dir::Cache=$apt/cache")
    (
        cd "$apt" && rm -rf "./${package}_"* "$root/source/$name.new" &&
            apt-get "${options[@]}" update &&
            apt-get "${options[@]}" source --download-only "$package" &&
            dpkg-source --no-check -x "./${package}_"*.dsc "$root/source/$name.new" &&
            mv "$root/source/$name.new" "$root/source/$name"
    )
}

# Builds oneTBB, GoogleTest and what Wine needs, once.
provide_windows_libraries() {
    local root=$windows_libraries
    # Never the machine's whole include folder.
    mkdir -p "$root/include"
    ln -sfn /usr/include/CL "$root/include/CL"
    run_quietly "$root/keep-sigquit.log" cc -shared -fPIC -O2 \
        -o "$root/keep-sigquit.so" "$project_dir/cmake/windows/KeepSigquit.c"
    if [[ ! -f $root/bin/tbb12.dll ]]; then
        echo "Building oneTBB for Windows ..."
        run_quietly "$root/tbb-source.log" fetch_source "$root" tbb onetbb
        # With a prefix its allocator, which it opens by name, would silently be malloc.
        run_quietly "$root/tbb.log" cross_build "$root" tbb "$root/source/tbb" \
            -DTBB_TEST=OFF -DTBB_STRICT=OFF -DTBBMALLOC_PROXY_BUILD=OFF -DTBB_ENABLE_IPO=OFF \
            -DCMAKE_PROJECT_INCLUDE="$project_dir/cmake/windows/no-prefix.cmake"
    fi
    if [[ ! -f $root/lib/libgmock.a ]]; then
        echo "Building GoogleTest for Windows ..."
        run_quietly "$root/googletest.log" cross_build "$root" googletest /usr/src/googletest
    fi
}
