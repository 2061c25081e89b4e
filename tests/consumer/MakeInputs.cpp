// Writes the files the README's example is run on besides the corpus: a 12-bit JPEG image, a text file and a
// NITF file without images.   nitf-consumer-inputs DIR
#include <cstdio>
#include <fstream>
#include <string>

#include "JpegStreams.h"
#include "NitfSampleWriter.h"

int main(int argc, char** argv) {
    if (argc != 2)
        return 2;
    std::string dir = argv[1];

    jpegtest::Coding coding;
    coding.precision = 12;
    nitfsample::Image image;
    image.ic = "C3";
    image.comrat = "00.0";
    image.rows = image.cols = 64;
    image.nppbh = image.nppbv = 64;
    image.nbpp = 12;
    image.blockData = {jpegtest::encode(jpegtest::pattern(64, 64, 1, 12), coding)};
    nitfsample::File jpeg;
    jpeg.images.push_back(image);
    nitfsample::write(jpeg, dir + "/jpeg12.ntf");

    nitfsample::File empty;
    nitfsample::write(empty, dir + "/no-images.ntf");

    std::ofstream(dir + "/text.txt") << "This is a text file, not an image.\n";
    return 0;
}
