"""Times the jobs of our benchmarks in OpenCV, SciPy and NumPy, one thread.

Prints a line a job: the name of our benchmark, the peer, seconds for a pixel. The image is 2048 x 2048
pixels of one-look speckle; slow peers get a smaller piece of it. The least of several runs counts.
"""

import time

import cv2
import numpy as np
from scipy import ndimage

SIDE = 2048
cv2.setNumThreads(1)


def speckle(dtype, side=SIDE):
    samples = np.random.default_rng(20240229).exponential(40.0, (side, side))
    if np.issubdtype(dtype, np.integer):
        samples = np.minimum(samples, np.iinfo(dtype).max)
    return samples.astype(dtype)


def seconds(job, least=0.3):
    job()
    best, spent = float("inf"), 0.0
    while spent < least:
        begin = time.perf_counter()
        job()
        taken = time.perf_counter() - begin
        best, spent = min(best, taken), spent + taken
    return best


def tell(name, peer, job, pixels=SIDE * SIDE):
    print(f"{name}\t{peer}\t{seconds(job) / pixels:.6e}", flush=True)


def box_statistics(image, window=7):
    """Mean and variance by box filters, all temporaries made once."""
    squares = np.empty_like(image)
    mean = np.empty_like(image)
    variance = np.empty_like(image)
    scratch = np.empty_like(image)
    factor = window * window / (window * window - 1.0)

    def update():
        cv2.boxFilter(image, -1, (window, window), dst=mean)
        np.multiply(image, image, out=squares)
        cv2.boxFilter(squares, -1, (window, window), dst=variance)
        np.multiply(mean, mean, out=scratch)
        np.subtract(variance, scratch, out=variance)
        np.multiply(variance, factor, out=variance)

    return update, mean, variance, scratch


def window_filters():
    image = speckle(np.float64)
    out = np.empty_like(image)
    tell("BM_FilterAverage<double>/channels:1/masked:0", "OpenCV boxFilter",
         lambda: cv2.boxFilter(image, -1, (7, 7), dst=out))
    update, mean, variance, scratch = box_statistics(image)

    def deviation():
        update()
        np.sqrt(variance, out=out)

    def lee(looks=1.0):
        update()
        np.multiply(mean, mean, out=scratch)
        np.divide(scratch, variance, out=scratch)
        np.subtract(1.0, scratch, out=scratch)
        np.maximum(scratch, 0.0, out=scratch)
        np.subtract(image, mean, out=out)
        np.multiply(out, scratch, out=out)
        np.add(out, mean, out=out)

    def kuan(looks=1.0):
        update()
        np.multiply(mean, mean, out=scratch)
        np.divide(scratch, variance, out=scratch)
        np.subtract(looks, scratch, out=scratch)
        np.multiply(scratch, 1.0 / (looks + 1.0), out=scratch)
        np.maximum(scratch, 0.0, out=scratch)
        np.subtract(image, mean, out=out)
        np.multiply(out, scratch, out=out)
        np.add(out, mean, out=out)

    def gamma(looks=1.0):
        mean = ndimage.uniform_filter(image, 7)
        square = mean * mean
        variance = ndimage.uniform_filter(image * image, 7) - square
        a = (looks + 1.0) * square / (looks * variance - square)
        b = a - looks - 1.0
        d = 4.0 * a * looks * mean * image + b * b * square
        middle = (b * mean + np.sqrt(np.maximum(d, 0.0))) / (2.0 * a)
        return np.where(square >= looks * variance, mean,
                        np.where(looks * variance >= 2.0 * square, image, middle))

    def laplacian():
        cv2.boxFilter(image, -1, (7, 7), dst=mean)
        np.subtract(image, mean, out=out)

    tell("BM_FilterStdDeviation/channels:1/masked:0", "OpenCV boxes", deviation)
    tell("BM_FilterFle<1>/channels:1/masked:0", "OpenCV boxes", lee)
    tell("BM_FilterKuan/channels:1/masked:0", "OpenCV boxes", kuan)
    tell("BM_FilterLaplacian/channels:1/masked:0", "OpenCV boxes", laplacian)
    with np.errstate(all="ignore"):
        tell("BM_FilterGamma/channels:1/masked:0", "NumPy, SciPy", gamma)


def medians():
    names = {np.uint8: "unsigned char", np.uint16: "unsigned short", np.float32: "float"}
    for dtype, name in names.items():
        image = speckle(dtype)
        for side in (3, 5, 7):
            if side < 7 or dtype == np.uint8:
                tell(f"BM_FilterMedian<{name}>/side:{side}", "OpenCV medianBlur",
                     lambda: cv2.medianBlur(image, side))
    image = speckle(np.float32, 256)
    tell("BM_FilterMedian<float>/side:7", "SciPy median_filter",
         lambda: ndimage.median_filter(image, 7), 256 * 256)


def stencils():
    image = speckle(np.float64)
    out = np.empty_like(image)
    kernel = np.exp(-np.arange(-4.0, 5.0) ** 2 / 8.0)
    kernel /= kernel.sum()
    tell("BM_FilterGauss/side:9/kernels:1/masked:0", "OpenCV sepFilter2D",
         lambda: cv2.sepFilter2D(image, -1, kernel, kernel, dst=out))
    down = np.empty_like(image)

    def sobel():
        cv2.Sobel(image, cv2.CV_64F, 1, 0, dst=out)
        cv2.Sobel(image, cv2.CV_64F, 0, 1, dst=down)
        cv2.magnitude(out, down, magnitude=out)

    tell("BM_FilterSobel/masked:0", "OpenCV Sobel, magnitude", sobel)
    names = {np.uint8: "unsigned char", np.float32: "float", np.float64: "double"}
    for dtype, name in names.items():
        image = speckle(dtype)
        for side in (5, 9):
            weights = np.random.default_rng(1).random((side, side)) / (side * side)
            tell(f"BM_FilterCustom<{name}>/side:{side}/masked:0", "OpenCV filter2D",
                 lambda: cv2.filter2D(image, -1, weights))


def modes():
    image = speckle(np.uint8, 128)

    def most_frequent(window):
        values, counts = np.unique(window, return_counts=True)
        return values[np.argmax(counts)]

    tell("BM_FilterMode<unsigned char>/side:3", "SciPy generic_filter",
         lambda: ndimage.generic_filter(image, most_frequent, 3), 128 * 128)


def statistics():
    bands = np.random.default_rng(1).normal(100.0, 20.0, (SIDE * SIDE, 6)).astype(np.float32)
    tell("BM_Covariance<float>/channels:6", "NumPy cov", lambda: np.cov(bands, rowvar=False))
    tell("BM_Covariance<float>/channels:6", "OpenCV calcCovarMatrix",
         lambda: cv2.calcCovarMatrix(bands, None, cv2.COVAR_NORMAL | cv2.COVAR_ROWS))
    root = np.random.default_rng(1).normal(0.0, 30.0, (64, 64)).astype(np.float32)
    for size in (6, 16, 64):
        matrix = root[:size, :size] @ root[:size, :size].T
        tell(f"BM_Eigensystem/channels:{size}", "LAPACK eigh", lambda: np.linalg.eigh(matrix), 1)


def transforms():
    bands = np.random.default_rng(1).normal(100.0, 20.0, (SIDE * SIDE, 6)).astype(np.float32)
    means = bands.mean(axis=0)
    vectors = np.linalg.eigh(np.cov(bands[:10000], rowvar=False))[1].astype(np.float32)
    middle, out = np.empty_like(bands), np.empty_like(bands)

    def project():
        np.subtract(bands, means, out=middle)
        np.matmul(middle, vectors, out=out)
        np.multiply(out, np.float32(0.5), out=out)
        np.add(out, np.float32(127.5), out=out)

    tell("BM_FilterPCA<float, float>/channels:6/outputs:6", "NumPy matmul", project)
    classes = speckle(np.uint8)
    table = (np.arange(256) * 37 % 256).astype(np.uint8)
    mapped = np.empty_like(classes)
    tell("BM_FilterHOM<unsigned char, unsigned char>", "OpenCV LUT",
         lambda: cv2.LUT(classes, table, dst=mapped))


if __name__ == "__main__":
    window_filters()
    medians()
    stencils()
    modes()
    statistics()
    transforms()
