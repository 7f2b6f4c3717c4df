# What the commands for Windows have in common. Sourced after common.sh.

windows_libraries=$project_dir/build/windows-libraries
# Libraries that take an hour to build, kept for all clones.
windows_kept=${XDG_CACHE_HOME:-$HOME/.cache}/vyra-opencl/windows

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

# Whether Qt and Assimp have been built.
has_kept_windows_libraries() {
    [[ -f $windows_kept/qt-is-built && -f $windows_kept/assimp-is-built ]]
}

# Debian's source of Qt, without the modules that the viewer and the tool do not use.
build_qt() {
    local feature off=()
    # The tablet's header is not in Debian's source; DirectWrite 3 needs Direct2D to be complete.
    for feature in network sql dbus testlib xml printsupport concurrent widgets vulkan icu tabletevent direct2d \
        directwrite3 gif ico system_zlib system_png system_jpeg system_pcre2 system_freetype system_harfbuzz \
        system_doubleconversion; do
        off+=("-DFEATURE_$feature=OFF")
    done
    fetch_source "$windows_kept" qt qt6-base &&
        cross_build "$windows_kept" qt "$windows_kept/source/qt" -DVYRA_WINDOWS_QT="$windows_kept" \
            -DQT_HOST_PATH=/usr -DQT_HOST_PATH_CMAKE_DIR="/usr/lib/$(uname -m)-linux-gnu/cmake" \
            -DBUILD_SHARED_LIBS=ON -DQT_BUILD_EXAMPLES=OFF -DQT_BUILD_TESTS=OFF -DINPUT_opengl=desktop "${off[@]}" &&
        touch "$windows_kept/qt-is-built"
}

# Completes Debian's source of Assimp: minizip is a package of its own, the DLL has no resources, and
# the library for compressed glTF has no Windows build.
complete_assimp() {
    local source=$windows_kept/source/assimp minizip=$windows_kept/source/minizip
    if [[ -d $source/contrib/unzip ]]; then return; fi
    patch -R -p1 -d "$source" -i "$source/debian/patches/use-system-libdraco.patch" &&
        sed -i '/res\/assimp\.rc/d' "$source/code/CMakeLists.txt" &&
        mkdir "$source/contrib/unzip" &&
        touch "$source/contrib/unzip/crypt.c" &&
        cp "$minizip/"{unzip,ioapi,crypt}.h "$minizip/"{unzip,ioapi}.c "$source/contrib/unzip"
}

# Lets the cross-compiler find some of the machine's headers, and never its whole include folder.
link_headers() {
    local header
    mkdir -p "$windows_kept/include"
    for header in "$@"; do
        ln -sfn "/usr/include/$header" "$windows_kept/include/$header"
    done
}

# Assimp, with the importers of formats that artists exchange.
build_assimp() {
    local source=$windows_kept/source/assimp mingw=/usr/x86_64-w64-mingw32 importer importers=()
    for importer in 3DS BVH COLLADA FBX GLTF MD5 OBJ PLY SMD STL X; do
        importers+=("-DASSIMP_BUILD_${importer}_IMPORTER=ON")
    done
    fetch_source "$windows_kept" minizip minizip &&
        fetch_source "$windows_kept" assimp assimp &&
        complete_assimp &&
        link_headers utf8.h utf8 stb &&
        cross_build "$windows_kept" assimp "$source" -DVYRA_WINDOWS_QT="$windows_kept" \
            -DBUILD_SHARED_LIBS=ON -DASSIMP_BUILD_TESTS=OFF -DASSIMP_BUILD_ASSIMP_TOOLS=OFF \
            -DCMAKE_CXX_FLAGS="-isystem $windows_kept/include" -DASSIMP_NO_EXPORT=ON -DASSIMP_BUILD_MINIZIP=ON -DASSIMP_WARNINGS_AS_ERRORS=OFF \
            -DASSIMP_INSTALL_PDB=OFF -DZLIB_LIBRARY_REL="$mingw/lib/libz.a" -DZLIB_INCLUDE_DIR="$mingw/include" \
            -DCMAKE_PROJECT_INCLUDE="$project_dir/cmake/windows/no-prefix.cmake" \
            -DASSIMP_BUILD_ALL_IMPORTERS_BY_DEFAULT=OFF "${importers[@]}" &&
        touch "$windows_kept/assimp-is-built"
}

# Builds Qt and Assimp for Windows, once.
provide_kept_windows_libraries() {
    mkdir -p "$windows_kept"
    if [[ ! -f $windows_kept/qt-is-built ]]; then
        echo "Building Qt for Windows, which takes an hour on two cores ..."
        run_quietly "$windows_kept/qt.log" build_qt
    fi
    if [[ ! -f $windows_kept/assimp-is-built ]]; then
        echo "Building Assimp for Windows ..."
        run_quietly "$windows_kept/assimp.log" build_assimp
    fi
}
