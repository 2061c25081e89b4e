// Rational polynomial coefficients (the RPC00B and RPC00A TREs): the model that maps ground points (latitude,
// longitude, height) to image lines and samples, its inverse for a given height, and the mapping between an
// image chip and its full image given by an ICHIPB extension.
#pragma once

#include <cstdio>

#include "HostCompat.h"

class CNitfExtension;
class CNitfFile;
class CNitfTag;

class CRpcSource {
public:
    // The model as stored: offsets and scales of the normalisation, and the four polynomials of 20 terms
    // each, always in RPC00B term order (1, L, P, H, LP, LH, PH, L², P², H², PLH, L³, LP², LH², L²P, P³, PH²,
    // L²H, P²H, H³ with P, L, H the normalised latitude, longitude and height).
    struct Model {
        int success; // 1 when the producer declared the model valid
        double biasError, randomError;
        double lineOffset, sampleOffset, latitudeOffset, longitudeOffset, heightOffset;
        double lineScale, sampleScale, latitudeScale, longitudeScale, heightScale;
        double lineNumerator[20], lineDenominator[20], sampleNumerator[20], sampleDenominator[20];
    };

    // A source for the TRE `name` ("RPC00B" when null); RPC00A is read in its own term order and reordered.
    explicit CRpcSource(const char* name = nullptr);
    // A source for the tag's TRE, read from the tag's data.
    explicit CRpcSource(CNitfTag* tag);

    // Reads the coefficients from the data place. A TRE shorter than the model, or cut by the end of the
    // file, raises vexo::Exception; fields that are not numbers read as 0.
    void readNewInfo(FILE* fp);
    void readNewInfo(CNitfFile* file);

    const char* getName() const { return m_name; }
    // The data length of an RPC TRE (both kinds): 1041 bytes.
    __int64 computeStorageLength() const;

    const Model& getModel() const { return m_model; }
    void setModel(const Model& model) { m_model = model; }
    // Declared valid by its producer, with non-zero scales.
    bool isValid() const;

    // Takes the chip-to-full-image mapping from an ICHIPB extension that has been read: the least-squares
    // affine fit of its four grid points (exact for an affine chip). Returns false, leaving the source
    // without a chip, when the points do not define a mapping. With a chip, image coordinates below are the
    // chip's.
    bool setChip(CNitfExtension* ichipb);
    bool hasChip() const { return m_hasChip; }
    // Chip (row, column) to full image and back, in the coordinates of the ICHIPB grid points.
    void chipToFull(double row, double column, double* fullRow, double* fullColumn) const;
    void fullToChip(double fullRow, double fullColumn, double* row, double* column) const;

    // Ground (degrees, metres above the ellipsoid) to image (line, sample). False where the model has no
    // value (a denominator of 0, scales of 0).
    bool groundToImage(double latitude, double longitude, double height, double* line, double* sample) const;
    // Image (line, sample) at a given height to ground, by Newton iteration from the model's centre; it stops
    // when the image residual falls below a millionth of a pixel or the step below 1e-12 of the normalised
    // range. False when it does not converge within 50 steps or the model is singular there.
    bool imageToGround(double line, double sample, double height, double* latitude, double* longitude) const;

private:
    // Normalised image coordinates of normalised ground coordinates, with their derivatives in P and L when
    // `derivatives` is given (dLine/dP, dLine/dL, dSample/dP, dSample/dL).
    bool evaluate(double p, double l, double h, double* line, double* sample, double* derivatives) const;

    char m_name[7];
    __int64 m_dataOffset;
    __int64 m_dataLength;
    Model m_model;
    bool m_hasChip;
    double m_toFull[2][3]; // full row, column = m[.][0] + m[.][1] × row + m[.][2] × column
    double m_toChip[2][3]; // the inverse
};
