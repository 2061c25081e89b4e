// The field layouts of the TREs the library parses, in file order. Field names are the published ones;
// unnamed (reserved) fields are RESERVED_1, RESERVED_2, ... in file order. Binary values (float32 and the raw
// fields included) are kept as their bytes like every other field.
#include "TreTables.h"

#include <iterator>

namespace tre {
namespace layouts {

// clang-format off
// Aircraft information (version B). 207 bytes
static const Entry kACFTB[] = {
    Text("AC_MSN_ID", 20),
    Text("AC_TAIL_NO", 10),
    Text("AC_TO", 12),
    Text("SENSOR_ID_TYPE", 4),
    Text("SENSOR_ID", 6),
    Text("SCENE_SOURCE", 1),
    Text("SCNUM", 6),
    Text("PDATE", 8),
    Text("IMHOSTNO", 6),
    Text("IMREQID", 5),
    Text("MPLAN", 3),
    Text("ENTLOC", 25),
    Text("LOC_ACCY", 6),
    Text("ENTELV", 6),
    Text("ELV_UNIT", 1),
    Text("EXITLOC", 25),
    Text("EXITELV", 6),
    Text("TMAP", 7),
    Text("ROW_SPACING", 7),
    Text("ROW_SPACING_UNITS", 1),
    Text("COL_SPACING", 7),
    Text("COL_SPACING_UNITS", 1),
    Text("FOCAL_LENGTH", 6),
    Text("SENSERIAL", 6),
    Text("ABSWVER", 7),
    Text("CAL_DATE", 8),
    Text("PATCH_TOT", 4),
    Text("MTI_TOT", 3),
};

// Additional image identification (version B). 89 bytes
static const Entry kAIMIDB[] = {
    Text("ACQUISITION_DATE", 14),
    Text("MISSION_NO", 4),
    Text("MISSION_IDENTIFICATION", 10),
    Text("FLIGHT_NO", 2),
    Text("OP_NUM", 3),
    Text("CURRENT_SEGMENT", 2),
    Text("REPRO_NUM", 2),
    Text("REPLAY", 3),
    Text("RESERVED_1", 1),
    Text("START_TILE_COLUMN", 3),
    Text("START_TILE_ROW", 5),
    Text("END_SEGMENT", 2),
    Text("END_TILE_COLUMN", 3),
    Text("END_TILE_ROW", 5),
    Text("COUNTRY", 2),
    Text("RESERVED_2", 4),
    Text("LOCATION", 11),
    Text("RESERVED_3", 13),
};

// Cloud cover grid. 60 bytes
static const Entry kCSCCGA[] = {
    Text("CCG_SOURCE", 18),
    Text("REG_SENSOR", 6),
    Text("ORIGIN_LINE", 7),
    Text("ORIGIN_SAMPLE", 5),
    Text("AS_CELL_SIZE", 7),
    Text("CS_CELL_SIZE", 5),
    Text("CCG_MAX_LINE", 7),
    Text("CCG_MAX_SAMPLE", 5),
};

// Corner footprint. 109 bytes
static const Entry kCSCRNA[] = {
    Text("PREDICT_CORNERS", 1),
    Text("ULCNR_LAT", 9),
    Text("ULCNR_LONG", 10),
    Text("ULCNR_HT", 8),
    Text("URCNR_LAT", 9),
    Text("URCNR_LONG", 10),
    Text("URCNR_HT", 8),
    Text("LRCNR_LAT", 9),
    Text("LRCNR_LONG", 10),
    Text("LRCNR_HT", 8),
    Text("LLCNR_LAT", 9),
    Text("LLCNR_LONG", 10),
    Text("LLCNR_HT", 8),
};

// Dataset identification. 70 bytes
static const Entry kCSDIDA[] = {
    Text("DAY", 2),
    Text("MONTH", 3),
    Text("YEAR", 4),
    Text("PLATFORM_CODE", 2),
    Text("VEHICLE_ID", 2),
    Text("PASS", 2),
    Text("OPERATION", 3),
    Text("SENSOR_ID", 2),
    Text("PRODUCT_ID", 2),
    Text("RESERVED_1", 4),
    Text("TIME", 14),
    Text("PROCESS_TIME", 14),
    Text("RESERVED_2", 2),
    Text("RESERVED_3", 2),
    Text("RESERVED_4", 1),
    Text("RESERVED_5", 1),
    Text("SOFTWARE_VERSION_NUMBER", 10),
};

// Exploitation reference data (version A). 132 bytes
static const Entry kCSEXRA[] = {
    Text("SENSOR", 6),
    Text("TIME_FIRST_LINE_IMAGE", 12),
    Text("TIME_IMAGE_DURATION", 12),
    Text("MAX_GSD", 5),
    Text("ALONG_SCAN_GSD", 5),
    Text("CROSS_SCAN_GSD", 5),
    Text("GEO_MEAN_GSD", 5),
    Text("A_S_VERT_GSD", 5),
    Text("C_S_VERT_GSD", 5),
    Text("GEO_MEAN_VERT_GSD", 5),
    Text("GSD_BETA_ANGLE", 5),
    Text("DYNAMIC_RANGE", 5),
    Text("NUM_LINES", 7),
    Text("NUM_SAMPLES", 5),
    Text("ANGLE_TO_NORTH", 7),
    Text("OBLIQUITY_ANGLE", 6),
    Text("AZ_OF_OBLIQUITY", 7),
    Text("GRD_COVER", 1),
    Text("SNOW_DEPTH_CAT", 1),
    Text("SUN_AZIMUTH", 7),
    Text("SUN_ELEVATION", 7),
    Text("PREDICTED_NIIRS", 3),
    Text("CIRCL_ERR", 3),
    Text("LINEAR_ERR", 3),
};

// Processing information: nine reserved fields, then the bandwidth compression. 120 bytes
static const Entry kCSPROA[] = {
    Text("RESERVED_1", 12),
    Text("RESERVED_2", 12),
    Text("RESERVED_3", 12),
    Text("RESERVED_4", 12),
    Text("RESERVED_5", 12),
    Text("RESERVED_6", 12),
    Text("RESERVED_7", 12),
    Text("RESERVED_8", 12),
    Text("RESERVED_9", 12),
    Text("BWC", 12),
};

// Geo-positioning information. 443 bytes
static const Entry kGEOPSB[] = {
    Text("TYP", 3),
    Text("UNI", 3),
    Text("DAG", 80),
    Text("DCD", 4),
    Text("ELL", 80),
    Text("ELC", 3),
    Text("DVR", 80),
    Text("VDCDVR", 4),
    Text("SDA", 80),
    Text("VDCSDA", 4),
    Text("ZOR", 15),
    Text("GRD", 3),
    Text("GRN", 80),
    Text("ZNA", 4),
};

// Image chip support: the chip to full image grid points. 224 bytes
static const Entry kICHIPB[] = {
    Text("XFRM_FLAG", 2),
    Text("SCALE_FACTOR", 10),
    Text("ANAMRPH_CORR", 2),
    Text("SCANBLK_NUM", 2),
    Text("OP_ROW_11", 12),
    Text("OP_COL_11", 12),
    Text("OP_ROW_12", 12),
    Text("OP_COL_12", 12),
    Text("OP_ROW_21", 12),
    Text("OP_COL_21", 12),
    Text("OP_ROW_22", 12),
    Text("OP_COL_22", 12),
    Text("FI_ROW_11", 12),
    Text("FI_COL_11", 12),
    Text("FI_ROW_12", 12),
    Text("FI_COL_12", 12),
    Text("FI_ROW_21", 12),
    Text("FI_COL_21", 12),
    Text("FI_ROW_22", 12),
    Text("FI_COL_22", 12),
    Text("FI_ROW", 8),
    Text("FI_COL", 8),
};

// Local cartographic coordinates. 43 bytes
static const Entry kMAPLOB[] = {
    Text("UNILOA", 3),
    Text("LOD", 5),
    Text("LAD", 5),
    Text("LSO", 15),
    Text("PSO", 15),
};

// Mission target information. 101 bytes
static const Entry kMSTGTA[] = {
    Text("TGT_NUM", 5),
    Text("TGT_ID", 12),
    Text("TGT_BE", 15),
    Text("TGT_PRI", 3),
    Text("TGT_REQ", 12),
    Text("TGT_LTIOV", 12),
    Text("TGT_TYPE", 1),
    Text("TGT_COLL", 1),
    Text("TGT_CAT", 5),
    Text("TGT_UTC", 7),
    Text("TGT_ELEV", 6),
    Text("TGT_ELEV_UNIT", 1),
    Text("TGT_LOC", 21),
};

// Imagery access profile: equipment. 130 bytes
static const Entry kPIAEQA[] = {
    Text("EQPCODE", 7),
    Text("EQPNOMEN", 45),
    Text("EQPMAN", 64),
    Text("OBTYPE", 1),
    Text("ORDBAT", 3),
    Text("CTRYPROD", 2),
    Text("CTRYDSN", 2),
    Text("OBJVIEW", 6),
};

// Imagery access profile: event. 46 bytes
static const Entry kPIAEVA[] = {
    Text("EVENTNAME", 38),
    Text("EVENTTYPE", 8),
};

// Imagery access profile: image (version B), the first 13 fields of version C. 337 bytes
static const Entry kPIAIMB[] = {
    Text("CLOUDCVR", 3),
    Text("SRP", 1),
    Text("SENSMODE", 12),
    Text("SENSNAME", 18),
    Text("SOURCE", 255),
    Text("COMGEN", 2),
    Text("SUBQUAL", 1),
    Text("PIAMSNNUM", 7),
    Text("CAMSPECS", 32),
    Text("PROJID", 2),
    Text("GENERATION", 1),
    Text("ESD", 1),
    Text("OTHERCOND", 2),
};

// Imagery access profile: image (version C). 362 bytes
static const Entry kPIAIMC[] = {
    Text("CLOUDCVR", 3),
    Text("SRP", 1),
    Text("SENSMODE", 12),
    Text("SENSNAME", 18),
    Text("SOURCE", 255),
    Text("COMGEN", 2),
    Text("SUBQUAL", 1),
    Text("PIAMSNNUM", 7),
    Text("CAMSPECS", 32),
    Text("PROJID", 2),
    Text("GENERATION", 1),
    Text("ESD", 1),
    Text("OTHERCOND", 2),
    Text("MEANGSD", 7),
    Text("IDATUM", 3),
    Text("IELLIP", 3),
    Text("PREPROC", 2),
    Text("IPROJ", 2),
    Text("SATTRACK", 8),
};

// Imagery access profile: person (version A), birth date DDMMYY. 92 bytes
static const Entry kPIAPEA[] = {
    Text("LASTNME", 28),
    Text("FIRSTNME", 28),
    Text("MIDNME", 28),
    Text("DOB", 6),
    Text("ASSOCTRY", 2),
};

// Imagery access profile: person (version B), birth date CCYYMMDD. 94 bytes
static const Entry kPIAPEB[] = {
    Text("LASTNME", 28),
    Text("FIRSTNME", 28),
    Text("MIDNME", 28),
    Text("DOB", 8),
    Text("ASSOCTRY", 2),
};

// Imagery access profile: target (version A). 96 bytes
static const Entry kPIATGA[] = {
    Text("TGTUTM", 15),
    Text("PIATGAID", 15),
    Text("PIACTRY", 2),
    Text("PIACAT", 5),
    Text("TGTGEO", 15),
    Text("DATUM", 3),
    Text("TGTNAME", 38),
    Text("PERCOVER", 3),
};

// Imagery access profile: target (version B), with decimal degrees. 117 bytes
static const Entry kPIATGB[] = {
    Text("TGTUTM", 15),
    Text("PIATGAID", 15),
    Text("PIACTRY", 2),
    Text("PIACAT", 5),
    Text("TGTGEO", 15),
    Text("DATUM", 3),
    Text("TGTNAME", 38),
    Text("PERCOVER", 3),
    Text("TGTLAT", 10),
    Text("TGTLON", 11),
};

// RPF header section (binary fields big-endian). 48 bytes
static const Entry kRPFHDR[] = {
    Binary("LITTLE_BIG_ENDIAN_INDICATOR", 1),
    Binary("HEADER_SECTION_LENGTH", 2),
    Text("FILE_NAME", 12),
    Binary("NEW_REPLACEMENT_UPDATE_INDICATOR", 1),
    Text("GOVERNING_STANDARD_NUMBER", 15),
    Text("GOVERNING_STANDARD_DATE", 8),
    Text("SECURITY_CLASSIFICATION", 1),
    Text("SECURITY_COUNTRY_INTERNATIONAL_CODE", 2),
    Text("SECURITY_RELEASE_MARKING", 2),
    Binary("LOCATION_SECTION_LOCATION", 4),
};

// Standard identification (version C). 89 bytes
static const Entry kSTDIDC[] = {
    Text("ACQUISITION_DATE", 14),
    Text("MISSION", 14),
    Text("PASS", 2),
    Text("OP_NUM", 3),
    Text("START_SEGMENT", 2),
    Text("REPRO_NUM", 2),
    Text("REPLAY_REGEN", 3),
    Text("BLANK_FILL", 1),
    Text("START_COLUMN", 3),
    Text("START_ROW", 5),
    Text("END_SEGMENT", 2),
    Text("END_COLUMN", 3),
    Text("END_ROW", 5),
    Text("COUNTRY", 2),
    Text("WAC", 4),
    Text("LOCATION", 11),
    Text("RESERVED_1", 5),
    Text("RESERVED_2", 8),
};

// Stereo information (version B). 94 bytes
static const Entry kSTREOB[] = {
    Text("ST_ID", 60),
    Text("N_MATES", 1),
    Text("MATE_INSTANCE", 1),
    Text("B_CONV", 5),
    Text("E_CONV", 5),
    Text("B_ASYM", 5),
    Text("E_ASYM", 5),
    Text("B_BIE", 6),
    Text("E_BIE", 6),
};

// Exploitation usability. 107 bytes
static const Entry kUSE00A[] = {
    Text("ANGLE_TO_NORTH", 3),
    Text("MEAN_GSD", 5),
    Text("RESERVED_1", 1),
    Text("DYNAMIC_RANGE", 5),
    Text("RESERVED_2", 3),
    Text("RESERVED_3", 1),
    Text("RESERVED_4", 3),
    Text("OBL_ANG", 5),
    Text("ROLL_ANG", 6),
    Text("RESERVED_5", 12),
    Text("RESERVED_6", 15),
    Text("RESERVED_7", 4),
    Text("RESERVED_8", 1),
    Text("RESERVED_9", 3),
    Text("RESERVED_10", 1),
    Text("RESERVED_11", 1),
    Text("N_REF", 2),
    Text("REV_NUM", 5),
    Text("N_SEG", 3),
    Text("MAX_LP_SEG", 6),
    Text("RESERVED_12", 6),
    Text("RESERVED_13", 6),
    Text("SUN_EL", 5),
    Text("SUN_AZ", 5),
};

// General purpose band parameters (version B). EXISTENCE_MASK selects the optional fields: bit b is
// (mask >> b) & 1 of the big-endian value. The wavelength unit is present when any of the wavelength fields
// (bits 24 to 19) is; each uncertainty field follows its own bit.
static const Entry kBANDSB[] = {
    Text("COUNT", 5),
    Text("RADIOMETRIC_QUANTITY", 24),
    Text("RADIOMETRIC_QUANTITY_UNIT", 1),
    Text("SCALE_FACTOR", 4), // float32
    Text("ADDITIVE_FACTOR", 4), // float32
    Text("ROW_GSD", 7),
    Text("ROW_GSD_UNIT", 1),
    Text("COL_GSD", 7),
    Text("COL_GSD_UNIT", 1),
    Text("SPT_RESP_ROW", 7),
    Text("SPT_RESP_UNIT_ROW", 1),
    Text("SPT_RESP_COL", 7),
    Text("SPT_RESP_UNIT_COL", 1),
    Text("DATA_FLD_1", 48),
    Binary("EXISTENCE_MASK", 4),
    IfAnyBit("EXISTENCE_MASK", 0x80000000),
        Text("RADIOMETRIC_ADJUSTMENT_SURFACE", 24),
        Text("ATMOSPHERIC_ADJUSTMENT_ALTITUDE", 4), // float32
    End(),
    IfAnyBit("EXISTENCE_MASK", 0x40000000),
        Text("DIAMETER", 7),
    End(),
    IfAnyBit("EXISTENCE_MASK", 0x20000000),
        Text("DATA_FLD_2", 32),
    End(),
    IfAnyBit("EXISTENCE_MASK", 0x01F80000),
        Text("WAVE_LENGTH_UNIT", 1),
    End(),
    Repeat("COUNT"),
        IfAnyBit("EXISTENCE_MASK", 0x10000000),
            Text("BANDID", 50),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x08000000),
            Text("BAD_BAND", 1),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x04000000),
            Text("NIIRS", 3),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x02000000),
            Text("FOCAL_LEN", 5),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x01000000),
            Text("CWAVE", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00800000),
            Text("FWHM", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00400000),
            Text("FWHM_UNC", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00200000),
            Text("NOM_WAVE", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00100000),
            Text("NOM_WAVE_UNC", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00080000),
            Text("LBOUND", 7),
            Text("UBOUND", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00040000),
            Text("SCALE_FACTOR", 4), // float32
            Text("ADDITIVE_FACTOR", 4), // float32
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00020000),
            Text("START_TIME", 16),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00010000),
            Text("INT_TIME", 6),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00008000),
            Text("CALDRK", 6),
            Text("CALIBRATION_SENSITIVITY", 5),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00004000),
            Text("ROW_GSD", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00002000),
            Text("ROW_GSD_UNC", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00004000),
            Text("ROW_GSD_UNIT", 1),
            Text("COL_GSD", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00002000),
            Text("COL_GSD_UNC", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00004000),
            Text("COL_GSD_UNIT", 1),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00001000),
            Text("BKNOISE", 5),
            Text("SCNNOISE", 5),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000800),
            Text("SPT_RESP_FUNCTION_ROW", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000400),
            Text("SPT_RESP_UNC_ROW", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000800),
            Text("SPT_RESP_UNIT_ROW", 1),
            Text("SPT_RESP_FUNCTION_COL", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000400),
            Text("SPT_RESP_UNC_COL", 7),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000800),
            Text("SPT_RESP_UNIT_COL", 1),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000200),
            Text("DATA_FLD_3", 16),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000100),
            Text("DATA_FLD_4", 24),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000080),
            Text("DATA_FLD_5", 32),
        End(),
        IfAnyBit("EXISTENCE_MASK", 0x00000040),
            Text("DATA_FLD_6", 48),
        End(),
    End(),
    IfAnyBit("EXISTENCE_MASK", 0x00000001),
        Text("NUM_AUX_B", 2),
        Text("NUM_AUX_C", 2),
        Repeat("NUM_AUX_B"),
            Text("BAPF", 1),
            Text("UBAP", 7),
            Repeat("COUNT"),
                IfText("BAPF", "I"),
                    Text("APN", 10),
                End(),
                IfText("BAPF", "R"),
                    Text("APR", 4), // float32
                End(),
                IfText("BAPF", "A"),
                    Text("APA", 20),
                End(),
            End(),
        End(),
        Repeat("NUM_AUX_C"),
            Text("CAPF", 1),
            Text("UCAP", 7),
            IfText("CAPF", "I"),
                Text("APN", 10),
            End(),
            IfText("CAPF", "R"),
                Text("APR", 4), // float32
            End(),
            IfText("CAPF", "A"),
                Text("APA", 20),
            End(),
        End(),
    End(),
};

// Sensor field alignment: 1 + 106 bytes per band.
static const Entry kCSSFAA[] = {
    Text("NUM_BANDS", 1),
    Repeat("NUM_BANDS"),
        Text("BAND_TYPE", 1),
        Text("BAND_ID", 6),
        Text("FOC_LENGTH", 11),
        Text("NUM_DAP", 8),
        Text("NUM_FIR", 8),
        Text("DELTA", 7),
        Text("OPPOFF_X", 7),
        Text("OPPOFF_Y", 7),
        Text("OPPOFF_Z", 7),
        Text("START_X", 11),
        Text("START_Y", 11),
        Text("FINISH_X", 11),
        Text("FINISH_Y", 11),
    End(),
};

// Engineering data: labelled records whose label and data widths come from earlier fields of the record.
static const Entry kENGRDA[] = {
    Text("RESRC", 20),
    Text("RECNT", 3),
    Repeat("RECNT"),
        Text("ENGLN", 2),
        TextSizedBy("ENGLBL", "ENGLN"),
        Text("ENGMTXC", 4),
        Text("ENGMTXR", 4),
        Text("ENGTYP", 1),
        Text("ENGDTS", 1),
        Text("ENGDATU", 2),
        Text("ENGDATC", 8),
        TextSizedByProduct("ENGDATA", "ENGDATC", "ENGDTS"), // ENGDATC elements of ENGDTS bytes
    End(),
};

// Softcopy history: processing events, each with its comments and the values of the operations it flags.
static const Entry kHISTOA[] = {
    Text("SYSTYPE", 20),
    Text("PC", 12),
    Text("PE", 4),
    Text("REMAP_FLAG", 1),
    Text("LUTID", 2),
    Text("NEVENTS", 2),
    Repeat("NEVENTS"),
        Text("PDATE", 14),
        Text("PSITE", 10),
        Text("PAS", 10),
        Text("NIPCOM", 1),
        Repeat("NIPCOM"),
            Text("IPCOM", 80),
        End(),
        Text("IBPP", 2),
        Text("IPVTYPE", 3),
        Text("INBWC", 10),
        Text("DISP_FLAG", 1),
        Text("ROT_FLAG", 1),
        IfText("ROT_FLAG", "1"),
            Text("ROT_ANGLE", 8),
        End(),
        Text("ASYM_FLAG", 1),
        IfText("ASYM_FLAG", "1"),
            Text("ZOOMROW", 7),
            Text("ZOOMCOL", 7),
        End(),
        Text("PROJ_FLAG", 1),
        Text("SHARP_FLAG", 1),
        IfText("SHARP_FLAG", "1"),
            Text("SHARPFAM", 2),
            Text("SHARPMEM", 2),
        End(),
        Text("MAG_FLAG", 1),
        IfText("MAG_FLAG", "1"),
            Text("MAG_LEVEL", 7),
        End(),
        Text("DRA_FLAG", 1),
        IfText("DRA_FLAG", "1"),
            Text("DRA_MULT", 7),
            Text("DRA_SUB", 5),
        End(),
        Text("TTC_FLAG", 1),
        IfText("TTC_FLAG", "1"),
            Text("TTCFAM", 2),
            Text("TTCMEM", 2),
        End(),
        Text("DEVLUT_FLAG", 1),
        Text("OBPP", 2),
        Text("OPVTYPE", 3),
        Text("OUTBWC", 10),
    End(),
};

// Input/output amplitude mapping: one of four forms chosen by MAP_SELECT. The table of form 1 holds the output
// amplitude of each input amplitude 0..4095 as a 16-bit big-endian number. Form 3 has been written with a 1-byte
// TABLE_ID as well: its data length tells which.
static const Entry kIOMAPA[] = {
    Text("BAND_NUMBER", 3),
    Text("MAP_SELECT", 1),
    IfText("MAP_SELECT", "0"), // shift
        Text("S2", 2),
    End(),
    IfText("MAP_SELECT", "1"), // look-up table
        Text("TABLE_ID", 2),
        Text("S1", 2),
        Text("S2", 2),
        RepeatFixed(4096, 0),
            Binary("OUTPUT_MAP_VALUE", 2),
        End(),
    End(),
    IfText("MAP_SELECT", "2"), // logarithmic
        Text("TABLE_ID", 2),
        Text("S1", 2),
        Text("S2", 2),
        Text("R_WHOLE", 3),
        Text("R_FRACTION", 3),
    End(),
    IfText("MAP_SELECT", "3"), // piecewise polynomial
        IfDataFits(18, 24),
            Text("TABLE_ID", 1),
        End(),
        IfDataFitsNot(18, 24),
            Text("TABLE_ID", 2),
        End(),
        Text("S1", 2),
        Text("S2", 2),
        Text("NO_OF_SEGMENTS", 1),
        Text("XOB_1", 4),
        Text("XOB_2", 4),
        Repeat("NO_OF_SEGMENTS"),
            Text("OUT_B0", 4), // float32, as the five below
            Text("OUT_B1", 4),
            Text("OUT_B2", 4),
            Text("OUT_B3", 4),
            Text("OUT_B4", 4),
            Text("OUT_B5", 4),
        End(),
    End(),
};

// JPEG 2000 layer information. The values of the parsed stream follow for the odd ("parsed") origins, when the
// data has room for them.
static const Entry kJ2KLRA[] = {
    Text("ORIG", 1),
    Text("NLEVELS_O", 2),
    Text("NBANDS_O", 5),
    Text("NLAYERS_O", 3),
    Repeat("NLAYERS_O"),
        Text("LAYER_ID", 3),
        Text("BITRATE", 9),
    End(),
    IfOdd("ORIG"),
        IfDataLeft(10),
            Text("NLEVELS_I", 2),
            Text("NBANDS_I", 5),
            Text("NLAYERS_I", 3),
        End(),
    End(),
};

// Test identification text: the whole data.
static const Entry kJITCID[] = {
    RestOfData("FILCMT"),
};

// Image frame offsets (binary, big-endian). Frames 2..N are keyed FRAME_2_OFFSET.. like the first one.
static const Entry kNBLOCA[] = {
    Binary("FRAME_1_OFFSET", 4),
    Binary("NUMBER_OF_FRAMES", 4),
    Repeat("NUMBER_OF_FRAMES", -1, 2),
        Binary("FRAME_%d_OFFSET", 4),
    End(),
};

// Imagery access profile: product (versions C and D share the layout).
static const Entry kPIAPR[] = {
    Text("ACCESSID", 64),
    Text("FMCONTROL", 32),
    Text("SUBDET", 1),
    Text("PRODCODE", 2),
    Text("PRODUCERSE", 6),
    Text("PRODIDNO", 20),
    Text("PRODSNME", 10),
    Text("PRODUCERCD", 2),
    Text("PRODCRTIME", 14),
    Text("MAPID", 40),
    Text("SECTITLEREP", 2),
    Repeat("SECTITLEREP"),
        Text("SECTITLE", 40),
        Text("PPNUM", 5),
        Text("TPP", 3),
    End(),
    Text("REQORGREP", 2),
    Repeat("REQORGREP"),
        Text("REQORG", 64),
    End(),
    Text("KEYWORDREP", 2),
    Repeat("KEYWORDREP"),
        Text("KEYWORD", 255),
    End(),
    Text("ASSRPTREP", 2),
    Repeat("ASSRPTREP"),
        Text("ASSRPT", 20),
    End(),
    Text("ATEXTREP", 2),
    Repeat("ATEXTREP"),
        Text("ATEXT", 255),
    End(),
};

// Projection parameters: 113 + 15 bytes per parameter.
static const Entry kPRJPSB[] = {
    Text("PRN", 80),
    Text("PCO", 2),
    Text("NUM_PRJ", 1),
    Repeat("NUM_PRJ"),
        Text("PRJ", 15),
    End(),
    Text("XOR", 15),
    Text("YOR", 15),
};

// TREs without a published layout keep their whole data as one field.
static const Entry kESD001[] = {
    RestOfData("ESD001_DATA"),
};
static const Entry kIMUDTG[] = {
    RestOfData("IMUDTG_DATA"),
};
static const Entry kIMXDTG[] = {
    RestOfData("IMXDTG_DATA"),
};
static const Entry kMHUDTG[] = {
    RestOfData("MHUDTG_DATA"),
};
static const Entry kMHXDTG[] = {
    RestOfData("MHXDTG_DATA"),
};
static const Entry kTESTIN[] = {
    RestOfData("TESTIN_DATA"),
};

// ---- RPFIMG: the RPF location section and the RPF sections carried in the TRE (binary fields big-endian)

static const Entry kRpfLocationHeader[] = {
    Binary("LOCATION_SECTION_LENGTH", 2),
    Binary("COMPONENT_LOCATION_TABLE_OFFSET", 4),
    Binary("NUMBER_OF_COMPONENT_LOCATION_RECORDS", 2),
    Binary("COMPONENT_LOCATION_RECORD_LENGTH", 2),
    Binary("COMPONENT_AGGREGATE_LENGTH", 4),
};
// As many as the header counts, at its table offset.
static const Entry kRpfLocationRecords[] = {
    RepeatExternal(),
        Binary("COMPONENT_ID", 2),
        Binary("COMPONENT_LENGTH", 4),
        Binary("COMPONENT_LOCATION", 4),
    End(),
};
// 130: coverage section, float64 values.
static const Entry kRpfCoverage[] = {
    Text("UPPER_LEFT_LATITUDE", 8),
    Text("UPPER_LEFT_LONGITUDE", 8),
    Text("LOWER_LEFT_LATITUDE", 8),
    Text("LOWER_LEFT_LONGITUDE", 8),
    Text("UPPER_RIGHT_LATITUDE", 8),
    Text("UPPER_RIGHT_LONGITUDE", 8),
    Text("LOWER_RIGHT_LATITUDE", 8),
    Text("LOWER_RIGHT_LONGITUDE", 8),
    Text("NORTH_SOUTH_VERTICAL_RESOLUTION", 8),
    Text("EAST_WEST_HORIZONTAL_RESOLUTION", 8),
    Text("LATITUDE_VERTICAL_INTERVAL", 8),
    Text("LONGITUDE_HORIZONTAL_INTERVAL", 8),
};
// 131: compression section subheader.
static const Entry kRpfCompression[] = {
    Binary("COMPRESSION_ALGORITHM_ID", 2),
    Binary("NUMBER_OF_COMPRESSION_LOOKUP_OFFSET_RECORDS", 2),
    Binary("NUMBER_OF_COMPRESSION_PARAMETER_OFFSET_RECORDS", 2),
};
// 132: compression lookup subsection header, then its offset records (as many as 131 counts).
static const Entry kRpfLookupHeader[] = {
    Binary("COMPRESSION_LOOKUP_OFFSET_TABLE_OFFSET", 4),
    Binary("COMPRESSION_LOOKUP_TABLE_OFFSET_RECORD_LENGTH", 2),
};
static const Entry kRpfLookupRecords[] = {
    RepeatExternal(),
        Binary("COMPRESSION_LOOKUP_TABLE_ID", 2),
        Binary("NUMBER_OF_COMPRESSION_LOOKUP_RECORDS", 4),
        Binary("NUMBER_OF_VALUES_PER_COMPRESSION_LOOKUP_RECORD", 2),
        Binary("COMPRESSION_LOOKUP_VALUE_BIT_LENGTH", 2),
        Binary("COMPRESSION_LOOKUP_TABLE_OFFSET", 4),
    End(),
};
// 134: colour/grayscale section subheader.
static const Entry kRpfColorGrayscale[] = {
    Binary("NUMBER_OF_COLOR_GRAYSCALE_OFFSET_RECORDS", 1),
    Binary("NUMBER_OF_COLOR_CONVERTER_OFFSET_RECORDS", 1),
    Text("EXTERNAL_COLOR_GRAYSCALE_FILENAME", 12),
};
// 135: colormap subsection header, then its offset records (as many as 134 counts).
static const Entry kRpfColormapHeader[] = {
    Binary("COLORMAP_OFFSET_TABLE_OFFSET", 4),
    Binary("COLOR_GRAYSCALE_OFFSET_RECORD_LENGTH", 2),
};
static const Entry kRpfColormapRecords[] = {
    RepeatExternal(),
        Binary("COLOR_GRAYSCALE_TABLE_ID", 2),
        Binary("NUMBER_OF_COLOR_GRAYSCALE_RECORDS", 4),
        Binary("COLOR_GRAYSCALE_ELEMENT_LENGTH", 1),
        Binary("HISTOGRAM_RECORD_LENGTH", 2),
        Binary("COLOR_GRAYSCALE_TABLE_OFFSET", 4),
        Binary("HISTOGRAM_TABLE_OFFSET", 4),
    End(),
};
// 136: image description subheader.
static const Entry kRpfImageDescription[] = {
    Binary("NUMBER_OF_SPECTRAL_GROUPS", 2),
    Binary("NUMBER_OF_SUBFRAME_TABLES", 2),
    Binary("NUMBER_OF_SPECTRAL_BAND_TABLES", 2),
    Binary("NUMBER_OF_SPECTRAL_BAND_LINES_PER_IMAGE_ROW", 2),
    Binary("NUMBER_OF_SUBFRAMES_EAST_WEST", 2),
    Binary("NUMBER_OF_SUBFRAMES_NORTH_SOUTH", 2),
    Binary("NUMBER_OF_OUTPUT_COLUMNS_PER_SUBFRAME", 4),
    Binary("NUMBER_OF_OUTPUT_ROWS_PER_SUBFRAME", 4),
    Binary("SUBFRAME_MASK_TABLE_OFFSET", 4),
    Binary("TRANSPARENCY_MASK_TABLE_OFFSET", 4),
};
// 137: image display parameters subheader.
static const Entry kRpfImageDisplay[] = {
    Binary("NUMBER_OF_IMAGE_ROWS", 4),
    Binary("NUMBER_OF_IMAGE_CODES_PER_ROW", 4),
    Binary("IMAGE_CODE_BIT_LENGTH", 1),
};
// 138: mask subsection header; the transparent pixel code takes the bytes its bit length needs.
static const Entry kRpfMask[] = {
    Binary("SUBFRAME_SEQUENCE_RECORD_LENGTH", 2),
    Binary("TRANSPARENCY_SEQUENCE_RECORD_LENGTH", 2),
    Binary("TRANSPARENT_OUTPUT_PIXEL_CODE_LENGTH", 2),
    TextSizedByBits("TRANSPARENT_OUTPUT_PIXEL_CODE", "TRANSPARENT_OUTPUT_PIXEL_CODE_LENGTH"),
};
// clang-format on

// Each table is checked and prepared once, on first use.
template <size_t N, const Entry (&entries)[N]> static const Layout& prepared() {
    static const Layout layout(entries);
    return layout;
}

const Layout& ACFTB() {
    return prepared<std::size(kACFTB), kACFTB>();
}
const Layout& AIMIDB() {
    return prepared<std::size(kAIMIDB), kAIMIDB>();
}
const Layout& BANDSB() {
    return prepared<std::size(kBANDSB), kBANDSB>();
}
const Layout& CSCCGA() {
    return prepared<std::size(kCSCCGA), kCSCCGA>();
}
const Layout& CSCRNA() {
    return prepared<std::size(kCSCRNA), kCSCRNA>();
}
const Layout& CSDIDA() {
    return prepared<std::size(kCSDIDA), kCSDIDA>();
}
const Layout& CSEXRA() {
    return prepared<std::size(kCSEXRA), kCSEXRA>();
}
const Layout& CSPROA() {
    return prepared<std::size(kCSPROA), kCSPROA>();
}
const Layout& CSSFAA() {
    return prepared<std::size(kCSSFAA), kCSSFAA>();
}
const Layout& ENGRDA() {
    return prepared<std::size(kENGRDA), kENGRDA>();
}
const Layout& ESD001() {
    return prepared<std::size(kESD001), kESD001>();
}
const Layout& GEOPSB() {
    return prepared<std::size(kGEOPSB), kGEOPSB>();
}
const Layout& HISTOA() {
    return prepared<std::size(kHISTOA), kHISTOA>();
}
const Layout& ICHIPB() {
    return prepared<std::size(kICHIPB), kICHIPB>();
}
const Layout& IMUDTG() {
    return prepared<std::size(kIMUDTG), kIMUDTG>();
}
const Layout& IMXDTG() {
    return prepared<std::size(kIMXDTG), kIMXDTG>();
}
const Layout& IOMAPA() {
    return prepared<std::size(kIOMAPA), kIOMAPA>();
}
const Layout& J2KLRA() {
    return prepared<std::size(kJ2KLRA), kJ2KLRA>();
}
const Layout& JITCID() {
    return prepared<std::size(kJITCID), kJITCID>();
}
const Layout& MAPLOB() {
    return prepared<std::size(kMAPLOB), kMAPLOB>();
}
const Layout& MHUDTG() {
    return prepared<std::size(kMHUDTG), kMHUDTG>();
}
const Layout& MHXDTG() {
    return prepared<std::size(kMHXDTG), kMHXDTG>();
}
const Layout& MSTGTA() {
    return prepared<std::size(kMSTGTA), kMSTGTA>();
}
const Layout& NBLOCA() {
    return prepared<std::size(kNBLOCA), kNBLOCA>();
}
const Layout& PIAEQA() {
    return prepared<std::size(kPIAEQA), kPIAEQA>();
}
const Layout& PIAEVA() {
    return prepared<std::size(kPIAEVA), kPIAEVA>();
}
const Layout& PIAIMB() {
    return prepared<std::size(kPIAIMB), kPIAIMB>();
}
const Layout& PIAIMC() {
    return prepared<std::size(kPIAIMC), kPIAIMC>();
}
const Layout& PIAPEA() {
    return prepared<std::size(kPIAPEA), kPIAPEA>();
}
const Layout& PIAPEB() {
    return prepared<std::size(kPIAPEB), kPIAPEB>();
}
const Layout& PIAPR() {
    return prepared<std::size(kPIAPR), kPIAPR>();
}
const Layout& PIATGA() {
    return prepared<std::size(kPIATGA), kPIATGA>();
}
const Layout& PIATGB() {
    return prepared<std::size(kPIATGB), kPIATGB>();
}
const Layout& PRJPSB() {
    return prepared<std::size(kPRJPSB), kPRJPSB>();
}
const Layout& RPFHDR() {
    return prepared<std::size(kRPFHDR), kRPFHDR>();
}
const Layout& STDIDC() {
    return prepared<std::size(kSTDIDC), kSTDIDC>();
}
const Layout& STREOB() {
    return prepared<std::size(kSTREOB), kSTREOB>();
}
const Layout& TESTIN() {
    return prepared<std::size(kTESTIN), kTESTIN>();
}
const Layout& USE00A() {
    return prepared<std::size(kUSE00A), kUSE00A>();
}
const Layout& RpfLocationHeader() {
    return prepared<std::size(kRpfLocationHeader), kRpfLocationHeader>();
}
const Layout& RpfLocationRecords() {
    return prepared<std::size(kRpfLocationRecords), kRpfLocationRecords>();
}
const Layout& RpfCoverage() {
    return prepared<std::size(kRpfCoverage), kRpfCoverage>();
}
const Layout& RpfCompression() {
    return prepared<std::size(kRpfCompression), kRpfCompression>();
}
const Layout& RpfLookupHeader() {
    return prepared<std::size(kRpfLookupHeader), kRpfLookupHeader>();
}
const Layout& RpfLookupRecords() {
    return prepared<std::size(kRpfLookupRecords), kRpfLookupRecords>();
}
const Layout& RpfColorGrayscale() {
    return prepared<std::size(kRpfColorGrayscale), kRpfColorGrayscale>();
}
const Layout& RpfColormapHeader() {
    return prepared<std::size(kRpfColormapHeader), kRpfColormapHeader>();
}
const Layout& RpfColormapRecords() {
    return prepared<std::size(kRpfColormapRecords), kRpfColormapRecords>();
}
const Layout& RpfImageDescription() {
    return prepared<std::size(kRpfImageDescription), kRpfImageDescription>();
}
const Layout& RpfImageDisplay() {
    return prepared<std::size(kRpfImageDisplay), kRpfImageDisplay>();
}
const Layout& RpfMask() {
    return prepared<std::size(kRpfMask), kRpfMask>();
}

} // namespace layouts
} // namespace tre
