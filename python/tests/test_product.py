# SPDX-License-Identifier: Apache-2.0
import pickle

import pytest
from quo_base import (
    Configuration,
    Coregistration,
    Error,
    FileError,
    NumericError,
    ParameterFile,
    Product,
    RasterWriter,
    Refused,
    Region,
)
from quo_base.models import review


def test_fields_have_one_value_under_all_their_names(scene_file):
    product = Product(scene_file)
    assert product.SamplingConstants.prf_hz == product["SamplingConstants"]["prf_hz"] == 1717.128973878037
    assert product["SamplingConstants/prf_hz"] == dict(product.walk())["SamplingConstants/prf_hz"]
    vectors = product.StateVectorData
    assert vectors.pSV_m.shape == (48,) and not vectors.pSV_m.flags.writeable
    assert vectors.pSV_m[:3].tolist() == [5636962.746301, 791500.369838, 4194525.433967]
    assert "prf_hz" in repr(product.SamplingConstants) and "<td>prf_hz</td>" in product._repr_html_()


def test_copies_have_the_same_content_and_a_life_of_their_own(scene_file, tmp_path):
    product = Product(scene_file)
    product.add("PolySAR", ndc=2)
    product["PolySAR/DopplerCentroid-1"].update(pol=[1.5, 0, 0, 0, 2, 0, 0], trg0_s=0.0055, taz0_s=1e9 / 7)
    product.add("RasterInfo", HeaderOffset=16)
    product.DataSetInfo.Description = "<né>"
    product.save(tmp_path / "copy.hdr", exact=True)
    for copy in (Product(tmp_path / "copy.hdr"), product.clone(), pickle.loads(pickle.dumps(product))):
        assert copy == product and copy.grid.times(7, 9) == product.grid.times(7, 9)
        copy.DataSetInfo.SceneID = "other"
        assert copy != product
    assert product.evaluate("DC", [0.0055, 0.0065], 1e9).tolist() == [1.5, 1.5 + 2 * (0.0065 - 0.0055) ** 2]


def test_the_grid_is_that_of_the_sections_as_they_are(scene_file, tmp_path):
    product = Product(scene_file)
    before = product.grid.times(0, 0)
    product.ROI.SlowStartTime += 0.25
    assert product.grid.times(0, 0).azimuth_time == before.azimuth_time + 0.25
    product.add("ImageGrid", Epoch_s=1.1e9, FirstLine_s=0.5, LineStep_s=0.002)
    product.ImageGrid.update(FirstSample_s=0.005, SampleStep_s=1e-8)
    assert product.grid.times(0, 0)[:2] == (1.1e9 + 0.5, 0.005)
    product.save(tmp_path / "broken.hdr")  # a grid that is none is not the region's
    text = (tmp_path / "broken.hdr").read_text()
    (tmp_path / "broken.hdr").write_text(text.replace("SampleStep_s", "Step_s"))
    for broken in (Product(tmp_path / "broken.hdr"), pickle.loads(pickle.dumps(Product(tmp_path / "broken.hdr")))):
        with pytest.raises(Refused, match="no pixel grid"):
            broken.grid
    del product["ImageGrid"], product["ROI"]
    with pytest.raises(Refused, match="no pixel grid"):
        pickle.loads(pickle.dumps(product)).grid


def test_sections_travel_and_tell_that_they_are_gone(scene_file):
    product = Product(scene_file)
    product.add("PolySAR", ndc=2)
    for section in (product.ROI, product["PolySAR/DopplerCentroid-1"]):
        assert pickle.loads(pickle.dumps(section)) == section
    section = product.ROI
    del product["ROI"]
    assert "no more" in repr(section)


def test_lengths_and_arrays_stay_together(scene_file):
    product = Product(scene_file)
    vectors, before = product.StateVectorData, dict(product.StateVectorData)
    refused = [
        dict(nSV_n=17, pSV_m=[1.0] * 48),
        dict(nSV_n=-1),
        dict(nSV_n=2**31),
        dict(t0SV_s="1"),
        dict(vSV_mOs=[1]),
    ]
    for fields in refused:
        with pytest.raises((ValueError, TypeError)):
            vectors.update(fields)
        assert vectors == before
    with pytest.raises(TypeError, match="Orbit"):
        product.orbit = 1.0
    with pytest.raises(KeyError):
        product.add("Pulse", Colour=1)
    assert "Pulse" not in product
    vectors.nSV_n = 7
    assert not vectors.pSV_m.any() and len(vectors.pSV_m) == 21
    product.orbit = Product(scene_file).orbit
    assert vectors == before


def test_counts_of_polynomials_keep_those_that_stay(scene_file):
    product = Product(scene_file)
    product.add("PolySAR", ndc=1, nfr=1)
    first, rate = product["PolySAR/DopplerCentroid-0"], product["PolySAR/DopplerRate-0"]
    first.pol = range(7)
    product.PolySAR.update(ndc=3, nfr=0)
    assert first.pol.tolist() == list(range(7)) and "PolySAR/DopplerCentroid-2" in product
    with pytest.raises(KeyError):
        rate["pol"]
    with pytest.raises(Refused):
        product.PolySAR.ndc = -1
    assert product.PolySAR.ndc == 3 and first.pol.tolist() == list(range(7))


@pytest.mark.parametrize(
    "status, kind, doing",
    [
        (9, FileError, lambda product, folder: Product(folder / "absent.hdr")),
        (5, FileError, lambda product, folder: product.save(folder / "absent" / "x.hdr")),
        (
            5,
            FileError,
            lambda product, folder: product.DataSetInfo.update(Track="\x01") or product.save(folder / "x"),
        ),
        (10, NumericError, lambda product, folder: product.evaluate("DC", 0.0055, 0.0)),
        (1, Refused, lambda product, folder: product.orbit.resample(0.0)),
    ],
)
def test_failures_tell_status_and_report_entry(scene_file, tmp_path, status, kind, doing):
    with pytest.raises(kind) as caught:
        doing(Product(scene_file), tmp_path)
    assert caught.value.status == status and caught.value.entry.message in str(caught.value)
    assert caught.value.system_error == (getattr(caught.value, "errno", None) or 0)
    assert not list(tmp_path.iterdir())
    copy = pickle.loads(pickle.dumps(caught.value))
    assert isinstance(copy, Error) and copy.entry == caught.value.entry


def test_files_that_are_no_header_are_named_with_the_line_of_the_defect(scene_file, tmp_path):
    (tmp_path / "cut.hdr").write_text("".join(scene_file.read_text().splitlines(True)[:30]))
    for name, kind, said in (("cut", Refused, r"cut\.hdr: .*line \d+"), ("absent", FileError, r"absent\.hdr: ")):
        with pytest.raises(kind, match=said):
            Product(tmp_path / (name + ".hdr"))
    for read in (Region.read, Coregistration.read, review, lambda name: Configuration.read(name, "AzimuthConf")):
        with pytest.raises(FileError, match=r"absent\.hdr: .*No such file.*status 9"):
            read(tmp_path / "absent.hdr")


@pytest.mark.parametrize("wrong", ["a\0.hdr", "\udcff.hdr", b"\xff", 3])
def test_names_that_would_be_cut_or_misread_are_refused(scene_file, tmp_path, monkeypatch, wrong):
    monkeypatch.chdir(tmp_path)
    for doing in (Product, Product(scene_file).save, ParameterFile, lambda name: RasterWriter(name, (1, 1), "f4")):
        with pytest.raises((ValueError, TypeError), match="file name|surrogates|os.PathLike"):
            doing(wrong)
    assert not list(tmp_path.iterdir())
