# Sourced by demo and docs/make, behind setup.sh: the sample image.

# A Landsat 7 cut-out, unpacked from the package that ships it; nothing of the package is installed.
sample_package=r-cran-stars
sample_folder=build/demo-data
sample_file=$sample_folder/usr/lib/R/site-library/stars/tif/L7_ETMs.tif

download_sample()
{
    mkdir -p $sample_folder
    (cd $sample_folder && rm -f -- *.deb && apt-get -q -o APT::Sandbox::User=root download $sample_package)
}

fetch_sample()
{
    if [ -f $sample_file ]; then
        return
    fi
    if ! command -v apt-get >/dev/null; then
        fail "The sample image comes from a Debian package, and this system has no apt-get." \
            "Any raster file of your own will do: ./demo FILE"
    fi
    # A system whose package lists were never read, or are out of date, gets a second try.
    download_sample 2>/dev/null || { apt update && download_sample; } ||
        fail "The sample image could not be downloaded (Debian package $sample_package, see above)." \
            "Any raster file of your own will do: ./demo FILE"
    dpkg-deb -x $sample_folder/$sample_package*.deb $sample_folder
    rm -f $sample_folder/*.deb
    [ -f $sample_file ] || fail "The Debian package $sample_package holds no ${sample_file##*/} any more."
}
