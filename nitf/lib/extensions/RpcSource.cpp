#include "RpcSource.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "DataStream.h"
#include "HostFile.h"
#include "NitfExtension.h"
#include "NitfFile.h"
#include "NitfTag.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/extensions/RpcSource";

// Widths of the fields before the coefficients, in file order; then 4 × 20 coefficients of 12 characters.
static const int kHeaderWidths[13] = {1, 7, 7, 6, 5, 8, 9, 5, 6, 5, 8, 9, 5};
static const int kCoefficientWidth = 12;
static const int kStorageLength = 81 + 4 * 20 * kCoefficientWidth;

// RPC00A term a (0-based) is RPC00B term kRpc00AToB[a].
static const int kRpc00AToB[20] = {0, 1, 2, 3, 4, 5, 6, 10, 7, 8, 9, 11, 14, 17, 12, 15, 18, 13, 16, 19};

CRpcSource::CRpcSource(const char* name) : m_dataOffset(0), m_dataLength(kStorageLength), m_hasChip(false) {
    const char* identifier = name ? name : "RPC00B";
    size_t length = strnlen(identifier, 6);
    std::memcpy(m_name, identifier, length);
    std::memset(m_name + length, 0, sizeof m_name - length);
    std::memset(&m_model, 0, sizeof m_model);
    std::memset(m_toFull, 0, sizeof m_toFull);
    std::memset(m_toChip, 0, sizeof m_toChip);
}

CRpcSource::CRpcSource(CNitfTag* tag) : CRpcSource(tag->getIdentifier()) {
    m_dataOffset = tag->getDataOffset();
    m_dataLength = tag->getDataLength();
}

__int64 CRpcSource::computeStorageLength() const {
    return kStorageLength;
}

// ---- reading
// -------------------------------------------------------------------------------------------------------

// The number in a fixed-width text field (0 when it is not one).
static double numberAt(const char* bytes, int width) {
    char text[16];
    std::memcpy(text, bytes, width);
    text[width] = '\0';
    return std::strtod(text, nullptr);
}

void CRpcSource::readNewInfo(FILE* fp) {
    static const char signature[] = "void __cdecl CRpcSource::readNewInfo(" NITF_FILE_SIG ")";
    if (m_dataLength < kStorageLength)
        NITF_RAISE_FORMAT(signature, "%s data of %lld bytes is short of the %d bytes of its model", m_name,
                          m_dataLength, kStorageLength);
    DKFSeek64(fp, m_dataOffset, SEEK_SET);
    CDataStream::requireReadable(fp, kStorageLength, "The RPC data");
    char bytes[kStorageLength];
    if (DKFRead(bytes, 1, kStorageLength, fp) != static_cast<size_t>(kStorageLength))
        NITF_RAISE("The RPC data could not be read", signature);

    const char* at = bytes;
    double header[13];
    for (int i = 0; i < 13; ++i) {
        header[i] = numberAt(at, kHeaderWidths[i]);
        at += kHeaderWidths[i];
    }
    Model& model = m_model;
    model.success = static_cast<int>(header[0]);
    model.biasError = header[1];
    model.randomError = header[2];
    model.lineOffset = header[3];
    model.sampleOffset = header[4];
    model.latitudeOffset = header[5];
    model.longitudeOffset = header[6];
    model.heightOffset = header[7];
    model.lineScale = header[8];
    model.sampleScale = header[9];
    model.latitudeScale = header[10];
    model.longitudeScale = header[11];
    model.heightScale = header[12];

    bool reorder = _strnicmp(m_name, "RPC00A", 6) == 0;
    double* polynomials[4] = {model.lineNumerator, model.lineDenominator, model.sampleNumerator,
                              model.sampleDenominator};
    for (double* polynomial : polynomials) {
        for (int term = 0; term < 20; ++term) {
            polynomial[reorder ? kRpc00AToB[term] : term] = numberAt(at, kCoefficientWidth);
            at += kCoefficientWidth;
        }
    }
}

void CRpcSource::readNewInfo(CNitfFile* file) {
    readNewInfo(file->getInputStream());
}

bool CRpcSource::isValid() const {
    const Model& m = m_model;
    return m.success == 1 && m.lineScale != 0 && m.sampleScale != 0 && m.latitudeScale != 0 &&
           m.longitudeScale != 0 && m.heightScale != 0;
}

// ---- the model
// -----------------------------------------------------------------------------------------------------

// The 20 terms in RPC00B order and, when asked, their derivatives in P and L.
static void terms(double p, double l, double h, double* t, double* dp, double* dl) {
    t[0] = 1;
    t[1] = l;
    t[2] = p;
    t[3] = h;
    t[4] = l * p;
    t[5] = l * h;
    t[6] = p * h;
    t[7] = l * l;
    t[8] = p * p;
    t[9] = h * h;
    t[10] = p * l * h;
    t[11] = l * l * l;
    t[12] = l * p * p;
    t[13] = l * h * h;
    t[14] = l * l * p;
    t[15] = p * p * p;
    t[16] = p * h * h;
    t[17] = l * l * h;
    t[18] = p * p * h;
    t[19] = h * h * h;
    if (!dp)
        return;
    const double dP[20] = {0,     0, 1,         0, l,     0,         h,     0, 2 * p,     0,
                           l * h, 0, 2 * l * p, 0, l * l, 3 * p * p, h * h, 0, 2 * p * h, 0};
    const double dL[20] = {0,     1,         0,     0,     p,         h, 0, 2 * l,     0, 0,
                           p * h, 3 * l * l, p * p, h * h, 2 * l * p, 0, 0, 2 * l * h, 0, 0};
    std::memcpy(dp, dP, sizeof dP);
    std::memcpy(dl, dL, sizeof dL);
}

static double dot(const double* a, const double* b) {
    double sum = 0;
    for (int i = 0; i < 20; ++i)
        sum += a[i] * b[i];
    return sum;
}

bool CRpcSource::evaluate(double p, double l, double h, double* line, double* sample,
                          double* derivatives) const {
    double t[20], dp[20], dl[20];
    terms(p, l, h, t, derivatives ? dp : nullptr, dl);
    const Model& m = m_model;
    double lineNum = dot(m.lineNumerator, t), lineDen = dot(m.lineDenominator, t);
    double sampleNum = dot(m.sampleNumerator, t), sampleDen = dot(m.sampleDenominator, t);
    if (lineDen == 0 || sampleDen == 0)
        return false;
    *line = lineNum / lineDen;
    *sample = sampleNum / sampleDen;
    if (derivatives) {
        // (N / D)' = (N' - (N / D) D') / D
        derivatives[0] = (dot(m.lineNumerator, dp) - *line * dot(m.lineDenominator, dp)) / lineDen;
        derivatives[1] = (dot(m.lineNumerator, dl) - *line * dot(m.lineDenominator, dl)) / lineDen;
        derivatives[2] = (dot(m.sampleNumerator, dp) - *sample * dot(m.sampleDenominator, dp)) / sampleDen;
        derivatives[3] = (dot(m.sampleNumerator, dl) - *sample * dot(m.sampleDenominator, dl)) / sampleDen;
    }
    return std::isfinite(*line) && std::isfinite(*sample);
}

bool CRpcSource::groundToImage(double latitude, double longitude, double height, double* line,
                               double* sample) const {
    const Model& m = m_model;
    if (m.latitudeScale == 0 || m.longitudeScale == 0 || m.heightScale == 0)
        return false;
    double r, c;
    if (!evaluate((latitude - m.latitudeOffset) / m.latitudeScale,
                  (longitude - m.longitudeOffset) / m.longitudeScale,
                  (height - m.heightOffset) / m.heightScale, &r, &c, nullptr))
        return false;
    double fullLine = m.lineOffset + m.lineScale * r;
    double fullSample = m.sampleOffset + m.sampleScale * c;
    if (m_hasChip) {
        fullToChip(fullLine, fullSample, line, sample);
    } else {
        *line = fullLine;
        *sample = fullSample;
    }
    return true;
}

bool CRpcSource::imageToGround(double line, double sample, double height, double* latitude,
                               double* longitude) const {
    const Model& m = m_model;
    if (m.lineScale == 0 || m.sampleScale == 0 || m.latitudeScale == 0 || m.longitudeScale == 0 ||
        m.heightScale == 0)
        return false;
    double fullLine = line, fullSample = sample;
    if (m_hasChip)
        chipToFull(line, sample, &fullLine, &fullSample);
    double targetR = (fullLine - m.lineOffset) / m.lineScale;
    double targetC = (fullSample - m.sampleOffset) / m.sampleScale;
    double h = (height - m.heightOffset) / m.heightScale;

    static const int kMaxSteps = 50;
    static const double kPixelTolerance = 1e-6;
    static const double kStepTolerance = 1e-12;
    double p = 0, l = 0; // the model's centre
    for (int step = 0; step < kMaxSteps; ++step) {
        double r, c, d[4];
        if (!evaluate(p, l, h, &r, &c, d))
            return false;
        double residualR = r - targetR, residualC = c - targetC;
        if (std::fabs(residualR * m.lineScale) < kPixelTolerance &&
            std::fabs(residualC * m.sampleScale) < kPixelTolerance) {
            *latitude = m.latitudeOffset + m.latitudeScale * p;
            *longitude = m.longitudeOffset + m.longitudeScale * l;
            return true;
        }
        // Solve [dr/dp dr/dl; dc/dp dc/dl] (dp, dl) = -(residualR, residualC).
        double determinant = d[0] * d[3] - d[1] * d[2];
        if (determinant == 0 || !std::isfinite(determinant))
            return false;
        double stepP = (-residualR * d[3] + residualC * d[1]) / determinant;
        double stepL = (-residualC * d[0] + residualR * d[2]) / determinant;
        p += stepP;
        l += stepL;
        if (std::fabs(stepP) < kStepTolerance && std::fabs(stepL) < kStepTolerance) {
            *latitude = m.latitudeOffset + m.latitudeScale * p;
            *longitude = m.longitudeOffset + m.longitudeScale * l;
            return true;
        }
    }
    return false;
}

// ---- the image chip
// ------------------------------------------------------------------------------------------------

// Solves the 3 × 3 system a x = b by Cramer's rule; false when it is singular.
static bool solve3(const double a[3][3], const double b[3], double x[3]) {
    auto det = [](const double m[3][3]) {
        return m[0][0] * (m[1][1] * m[2][2] - m[1][2] * m[2][1]) -
               m[0][1] * (m[1][0] * m[2][2] - m[1][2] * m[2][0]) +
               m[0][2] * (m[1][0] * m[2][1] - m[1][1] * m[2][0]);
    };
    double d = det(a);
    if (d == 0 || !std::isfinite(d))
        return false;
    for (int k = 0; k < 3; ++k) {
        double m[3][3];
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                m[i][j] = j == k ? b[i] : a[i][j];
        x[k] = det(m) / d;
    }
    return true;
}

static double propertyValue(CNitfExtension* extension, const char* name, bool* found) {
    CNitfProperty* property = FindProperty(extension->getProperties(), name);
    if (!property || property->getDataType() == CNitfProperty::eNone) {
        *found = false;
        return 0;
    }
    return property->getAsDouble();
}

bool CRpcSource::setChip(CNitfExtension* ichipb) {
    static const char* const kPoints[4] = {"11", "12", "21", "22"};
    // Least squares of full = a0 + a1 row + a2 column over the four grid points (normal equations).
    double normal[3][3] = {}, rhsRow[3] = {}, rhsColumn[3] = {};
    bool found = true;
    for (const char* point : kPoints) {
        char name[16];
        std::snprintf(name, sizeof name, "OP_ROW_%s", point);
        double row = propertyValue(ichipb, name, &found);
        std::snprintf(name, sizeof name, "OP_COL_%s", point);
        double column = propertyValue(ichipb, name, &found);
        std::snprintf(name, sizeof name, "FI_ROW_%s", point);
        double fullRow = propertyValue(ichipb, name, &found);
        std::snprintf(name, sizeof name, "FI_COL_%s", point);
        double fullColumn = propertyValue(ichipb, name, &found);
        const double basis[3] = {1, row, column};
        for (int i = 0; i < 3; ++i) {
            for (int j = 0; j < 3; ++j)
                normal[i][j] += basis[i] * basis[j];
            rhsRow[i] += basis[i] * fullRow;
            rhsColumn[i] += basis[i] * fullColumn;
        }
    }
    double toFull[2][3];
    if (!found || !solve3(normal, rhsRow, toFull[0]) || !solve3(normal, rhsColumn, toFull[1]))
        return false;
    double determinant = toFull[0][1] * toFull[1][2] - toFull[0][2] * toFull[1][1];
    if (determinant == 0 || !std::isfinite(determinant))
        return false;
    std::memcpy(m_toFull, toFull, sizeof toFull);
    // chip = inverse of the 2 × 2 part applied to (full - translation)
    m_toChip[0][1] = toFull[1][2] / determinant;
    m_toChip[0][2] = -toFull[0][2] / determinant;
    m_toChip[1][1] = -toFull[1][1] / determinant;
    m_toChip[1][2] = toFull[0][1] / determinant;
    m_toChip[0][0] = -(m_toChip[0][1] * toFull[0][0] + m_toChip[0][2] * toFull[1][0]);
    m_toChip[1][0] = -(m_toChip[1][1] * toFull[0][0] + m_toChip[1][2] * toFull[1][0]);
    m_hasChip = true;
    return true;
}

void CRpcSource::chipToFull(double row, double column, double* fullRow, double* fullColumn) const {
    *fullRow = m_toFull[0][0] + m_toFull[0][1] * row + m_toFull[0][2] * column;
    *fullColumn = m_toFull[1][0] + m_toFull[1][1] * row + m_toFull[1][2] * column;
}

void CRpcSource::fullToChip(double fullRow, double fullColumn, double* row, double* column) const {
    *row = m_toChip[0][0] + m_toChip[0][1] * fullRow + m_toChip[0][2] * fullColumn;
    *column = m_toChip[1][0] + m_toChip[1][1] * fullRow + m_toChip[1][2] * fullColumn;
}
