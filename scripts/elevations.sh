# Sourced by docs/make, behind setup.sh: a DEM of mountains and a fault scarp in Tennessee, by the U.S.
# Geological Survey, 344 rows of 403 elevations in metres.

# Unpacked from the package that ships it; nothing of the package is installed.
elevations_package=python-matplotlib-data
elevations_folder=build/demo-data/elevations
elevations_file=$elevations_folder/elevation.npy

fetch_elevations()
{
    if [ -f $elevations_file.hdr ]; then
        return
    fi
    mkdir -p $elevations_folder
    (
        cd $elevations_folder &&
            apt-get -q -o APT::Sandbox::User=root download $elevations_package &&
            dpkg-deb -x $elevations_package*.deb . &&
            unzip -oq usr/share/matplotlib/mpl-data/sample_data/jacksboro_fault_dem.npz elevation.npy
    ) || fail "The elevations could not be downloaded (Debian package $elevations_package, see above)."
    # 80 bytes of the file's own header stand before the samples.
    printf '%s\n' ENVI "samples = 403" "lines = 344" "bands = 1" "header offset = 80" \
        "data type = 2" "interleave = bsq" "byte order = 0" >$elevations_file.hdr
}
