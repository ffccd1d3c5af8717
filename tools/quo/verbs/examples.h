// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_EXAMPLES_H
#define QUO_TOOL_EXAMPLES_H

namespace tool {

/** How a verb is called, in lines that a shell takes as they stand. All of them are of one made-up folder, in
 * which each works: a product `image` with its header, a header `scene.xml` without a raster, and tables. */
struct Example {
    const char *verb, *lines;
};
inline constexpr Example kExamples[] = {
    {"import", "  quo import S1A_IW_SLC__1SDV.SAFE image --swath IW1 --polarization VV\n"},
    {"geolocate",
     "  printf 'line,sample\\n10,20\\n' | quo geolocate image --to ground --iso\n"
     "  quo geolocate image --to radar --pixels --input places.csv --output pixels.csv\n"},
    {"orbit",
     "  quo orbit scene.xml --every 10 --iso\n"
     "  quo orbit scene.xml --at 2022-01-04T17:06:10Z\n"},
    {"time", "  quo time --iso 1167930358.5 \"04-JAN-2022 17:05:58.5\"\n"},
    {"tiepoints", "  quo tiepoints scene.xml --points scene_tie_points.csv\n"},
    {"info", "  quo info image\n"},
    {"validate", "  quo validate scene.xml\n"},
    {"get", "  quo get scene.xml SamplingConstants/prf_hz\n"},
    {"set", "  quo set scene.xml DataSetInfo/SceneID \"Tyrrhenian Sea\"\n"},
    {"convert", "  quo convert image cut --lines 10:60 --samples :50 --type FLOAT_COMPLEX\n"},
    {"quicklook", "  quo quicklook image image.png --looks 2x1 --north-up --world\n"},
    {"footprint", "  quo footprint image > image.geojson\n"},
    {"stac", "  quo stac image > image.json\n"},
    {"vrt", "  quo vrt image\n"},
    {"spectrum", "  quo spectrum image spectrum.png --header image.hdr\n"},
    {"resample", "  quo resample image wide --samples 200\n"},
    {"derive", "  quo derive scene.xml --what fr --what angles\n"},
    {"fit", "  quo fit --degree 2 --input scene_tie_points.csv --x range_time_s --y incidence_deg\n"},
    {"coregister", "  quo coregister image scene.xml -o mapping.xml\n"},
    {"config",
     "  quo config new AzimuthConf -o processing.xml\n"
     "  quo config check processing.xml\n"},
    {"debug-dump", "  quo debug-dump chirp.dump --values 4\n"},
};

}  // namespace tool

#endif
