// Field formatting and the segment sub-headers of every version the sample writer knows.
#include "SampleInternal.h"

#include <stdexcept>

namespace nitfsample::detail {

namespace {

std::string fitted(const std::string& value, std::size_t width) {
    std::string out = value.substr(0, width);
    out.resize(width, ' ');
    return out;
}

std::string trimmed(const std::string& value) {
    std::size_t end = value.find_last_not_of(' ');
    return end == std::string::npos ? std::string() : value.substr(0, end + 1);
}

// Band field names are the field name followed by the 1-based band number.
std::string bandField(const char* name, int band) {
    return name + std::to_string(band + 1);
}

std::string derivedIrep(const Image& image) {
    if (!image.irep.empty())
        return image.irep;
    if (image.bands == 1)
        return "MONO";
    return image.bands == 3 ? "RGB" : "MULTI";
}

std::string derivedIrepband(const std::string& irep, int band, int bands) {
    std::string rep = trimmed(irep);
    if (rep == "RGB" && bands == 3)
        return std::string(1, "RGB"[band]);
    if (rep == "YCbCr601" && bands == 3)
        return band == 0 ? "Y" : band == 1 ? "Cb" : "Cr";
    if (rep == "RGB/LUT")
        return "LU";
    if (rep == "MONO")
        return "M";
    return "";
}

bool hasComrat(const std::string& ic, Family family) {
    if (family == Family::V20)
        return ic != "NC" && ic != "NM";
    for (const char* code : {"C1", "C3", "C4", "C5", "C8", "I1", "M1", "M3", "M4", "M5", "M8"})
        if (ic == code)
            return true;
    return false;
}

void bandFields(Fields& f, const Image& image, int band, const std::string& irep) {
    Band info = band < static_cast<int>(image.bandInfo.size()) ? image.bandInfo[band] : Band{};
    std::string irepband = info.irepband.empty() ? derivedIrepband(irep, band, image.bands) : info.irepband;
    f.text(bandField("IREPBAND", band), irepband, 2);
    f.text(bandField("ISUBCAT", band), info.isubcat, 6);
    f.text(bandField("IFC", band), "N", 1);
    f.text(bandField("IMFLT", band), "", 3);
    f.number(bandField("NLUTS", band), info.luts.size(), 1);
    if (info.luts.empty())
        return;
    std::size_t entries = info.luts.front().size();
    f.number(bandField("NELUT", band), entries, 5);
    for (const std::string& lut : info.luts) {
        if (lut.size() != entries)
            throw std::invalid_argument("nitfsample: the LUTs of one band must have the same length");
        f.raw(lut);
    }
}

} // namespace

Family familyOf(const std::string& version) {
    if (version == "NITF02.00")
        return Family::V20;
    if (version == "OSDE01.00")
        return Family::Osde;
    if (version == "NITF02.10" || version == "NSIF01.00")
        return Family::V21;
    throw std::invalid_argument("nitfsample: unsupported version '" + version + "'");
}

void Fields::text(const std::string& name, const std::string& value, std::size_t width) {
    auto it = overrides_.find(name);
    out_ += fitted(it != overrides_.end() ? it->second : value, width);
}

void Fields::number(const std::string& name, uint64_t value, std::size_t width) {
    std::string digits = std::to_string(value);
    if (digits.size() > width)
        throw std::invalid_argument("nitfsample: " + name + " = " + digits + " does not fit in " +
                                    std::to_string(width) + " digits");
    auto it = overrides_.find(name);
    out_ +=
        it != overrides_.end() ? fitted(it->second, width) : std::string(width - digits.size(), '0') + digits;
}

void Fields::binary(const std::string& name, const std::string& bytes) {
    auto it = overrides_.find(name);
    out_ += it != overrides_.end() ? fitted(it->second, bytes.size()) : bytes;
}

void Fields::treArea(const std::string& lengthName, const std::string& overflowName,
                     const std::vector<Tre>& tres, int overflow) {
    if (tres.empty() && overflow == 0) {
        number(lengthName, 0, 5);
        return;
    }
    std::string run = treBytes(tres);
    number(lengthName, run.size() + 3, 5);
    number(overflowName, overflow, 3);
    raw(run);
}

void Fields::security(Family family, const std::string& prefix, const Security& s) {
    const std::string& p = prefix;
    if (family == Family::V20) {
        text(p + "SCLAS", s.clas, 1);
        text(p + "SCODE", s.code, 40);
        text(p + "SCTLH", s.ctlh, 40);
        text(p + "SREL", s.rel, 40);
        text(p + "SCAUT", s.caut, 20);
        text(p + "SCTLN", s.ctln, 20);
        text(p + "SDWNG", s.dwng, 6);
        if (s.dwng == "999998")
            text(p + "SDEVT", s.devt, 40);
        return;
    }
    text(p + "SCLAS", s.clas, 1);
    text(p + "SCLSY", s.clsy, 2);
    text(p + "SCODE", s.code, 11);
    text(p + "SCTLH", s.ctlh, 2);
    text(p + "SREL", s.rel, 20);
    text(p + "SDCTP", s.dctp, 2);
    text(p + "SDCDT", s.dcdt, 8);
    text(p + "SDCXM", s.dcxm, 4);
    text(p + "SDG", s.dg, 1);
    text(p + "SDGDT", s.dgdt, 8);
    text(p + "SCLTX", s.cltx, 43);
    text(p + "SCATP", s.catp, 1);
    text(p + "SCAUT", s.caut, 40);
    text(p + "SCRSN", s.crsn, 1);
    text(p + "SSRDT", s.srdt, 8);
    text(p + "SCTLN", s.ctln, 15);
}

std::string security21Text(const std::string& prefix, const Security& security) {
    Overrides none;
    Fields f(none);
    f.security(Family::V21, prefix, security);
    return f.bytes();
}

std::string defaultDate(Family family) {
    return family == Family::V20 ? "15120000ZJUN24" : "20240615120000";
}

std::string imageSubheader(const Image& image, Family family) {
    const bool v20 = family == Family::V20;
    Fields f(image.fields);
    f.text("IM", "IM", 2);
    f.text(v20 ? "IID" : "IID1", image.iid1, 10);
    f.text("IDATIM", image.idatim.empty() ? defaultDate(family) : image.idatim, 14);
    if (family == Family::Osde) {
        f.text("IINFO", image.iinfo, 97);
        f.text("ISCSEC", security21Text("I", image.security), 167);
    } else {
        f.text("TGTID", image.tgtid, 17);
        f.text(v20 ? "ITITLE" : "IID2", image.iid2, 80);
        f.security(family, "I", image.security);
    }
    f.text("ENCRYP", "0", 1);
    f.text("ISORCE", image.isorce, 42);
    f.number("NROWS", image.rows, 8);
    f.number("NCOLS", image.cols, 8);
    f.text("PVTYPE", image.pvtype, 3);
    std::string irep = derivedIrep(image);
    f.text("IREP", irep, 8);
    f.text("ICAT", image.icat, 8);
    f.number("ABPP", image.abpp == 0 ? image.nbpp : image.abpp, 2);
    f.character("PJUST", image.pjust);
    const char none = v20 ? 'N' : ' ';
    const char icords = image.icords == 0 ? none : image.icords;
    f.character("ICORDS", icords);
    if (icords != none)
        f.text("IGEOLO", image.igeolo, 60);
    if (image.comments.size() > 9)
        throw std::invalid_argument("nitfsample: at most 9 image comments");
    f.number("NICOM", image.comments.size(), 1);
    for (std::size_t i = 0; i < image.comments.size(); ++i)
        f.text("ICOM" + std::to_string(i + 1), image.comments[i], 80);
    f.text("IC", image.ic, 2);
    if (hasComrat(image.ic, family))
        f.text("COMRAT", image.comrat, 4);
    if (image.bands <= 9) {
        f.number("NBANDS", image.bands, 1);
    } else if (v20) {
        throw std::invalid_argument("nitfsample: NITF 2.0 images have at most 9 bands");
    } else {
        f.number("NBANDS", 0, 1);
        f.number("XBANDS", image.bands, 5);
    }
    for (int band = 0; band < image.bands; ++band)
        bandFields(f, image, band, irep);
    Geometry g = geometry(image);
    f.number("ISYNC", image.isync, 1);
    f.character("IMODE", image.imode);
    f.number("NBPR", g.blocksPerRow, 4);
    f.number("NBPC", g.blocksPerColumn, 4);
    f.number("NPPBH", image.nppbh, 4);
    f.number("NPPBV", image.nppbv, 4);
    f.number("NBPP", image.nbpp, 2);
    f.number("IDLVL", image.idlvl, 3);
    f.number("IALVL", image.ialvl, 3);
    f.text("ILOC", image.iloc, 10);
    f.text("IMAG", image.imag, 4);
    f.treArea("UDIDL", "UDOFL", image.udid, image.udofl);
    f.treArea("IXSHDL", "IXSOFL", image.ixshd, image.ixsofl);
    return f.bytes();
}

std::string graphicSubheader(const Graphic& graphic, Family family) {
    Fields f(graphic.fields);
    f.text("SY", "SY", 2);
    f.text("SID", graphic.sid, 10);
    f.text("SNAME", graphic.sname, 20);
    f.security(family, "S", graphic.security);
    f.text("ENCRYP", "0", 1);
    if (family == Family::V20) {
        f.character("STYPE", graphic.sfmt);
        f.number("NLIPS", graphic.nlips, 4);
        f.number("NPIXPL", graphic.npixpl, 4);
        f.number("NWDTH", graphic.nwdth, 4);
        f.number("NBPP", graphic.nbpp, 1);
        f.number("SDLVL", graphic.sdlvl, 3);
        f.number("SALVL", graphic.salvl, 3);
        f.text("SLOC", graphic.sloc, 10);
        f.text("SLOC2", graphic.sloc2, 10);
        f.character("SCOLOR", graphic.scolor);
        f.text("SNUM", graphic.snum, 6);
        f.number("SROT", graphic.srot, 3);
        f.number("NELUT", graphic.nelut, 3);
        if (graphic.nelut != 0)
            f.raw(graphic.dlut);
    } else {
        f.character("SFMT", graphic.sfmt);
        f.text("SSTRUCT", "0000000000000", 13);
        f.number("SDLVL", graphic.sdlvl, 3);
        f.number("SALVL", graphic.salvl, 3);
        f.text("SLOC", graphic.sloc, 10);
        f.text("SBND1", graphic.sbnd1, 10);
        f.character("SCOLOR", graphic.scolor);
        f.text("SBND2", graphic.sbnd2, 10);
        f.text("SRES2", "00", 2);
    }
    f.treArea("SXSHDL", "SXSOFL", graphic.tres, graphic.sxsofl);
    return f.bytes();
}

std::string labelSubheader(const Label& label) {
    Fields f(label.fields);
    f.text("LA", "LA", 2);
    f.text("LID", label.lid, 10);
    f.security(Family::V20, "L", label.security);
    f.text("ENCRYP", "0", 1);
    f.character("LFS", label.lfs);
    f.number("LCW", label.lcw, 2);
    f.number("LCH", label.lch, 2);
    f.number("LDLVL", label.ldlvl, 3);
    f.number("LALVL", label.lalvl, 3);
    f.text("LLOC", label.lloc, 10);
    f.binary("LTC", fitted(label.ltc, 3));
    f.binary("LBC", fitted(label.lbc, 3));
    f.treArea("LXSHDL", "LXSOFL", label.tres, label.lxsofl);
    return f.bytes();
}

std::string textSubheader(const Text& text, Family family) {
    Fields f(text.fields);
    f.text("TE", "TE", 2);
    if (family == Family::V20) {
        f.text("TEXTID", text.textid, 10);
    } else {
        f.text("TEXTID", text.textid, 7);
        f.number("TXTALVL", text.txtalvl, 3);
    }
    f.text("TXTDT", text.txtdt.empty() ? defaultDate(family) : text.txtdt, 14);
    f.text("TXTITL", text.txtitl, 80);
    f.security(family, "T", text.security);
    f.text("ENCRYP", "0", 1);
    f.text("TXTFMT", text.txtfmt, 3);
    f.treArea("TXSHDL", "TXSOFL", text.tres, text.txsofl);
    return f.bytes();
}

std::string desSubheader(const Des& des, Family family) {
    const bool v20 = family == Family::V20;
    Fields f(des.fields);
    f.text("DE", "DE", 2);
    f.text(v20 ? "DESTAG" : "DESID", des.desid, 25);
    f.number("DESVER", des.desver, 2);
    if (family == Family::Osde)
        f.text("DESSEC", security21Text("DE", des.security), 167);
    else
        f.security(family, "DE", des.security);
    std::string id = trimmed(des.desid);
    bool overflow =
        v20 ? id == "Registered Extensions" || id == "Controlled Extensions" : id == "TRE_OVERFLOW";
    if (overflow) {
        f.text("DESOFLW", des.desoflw, 6);
        f.number("DESITEM", des.desitem, 3);
    }
    f.number("DESSHL", des.desshf.size(), 4);
    f.text("DESSHF", des.desshf, des.desshf.size());
    return f.bytes();
}

std::string resSubheader(const Res& res, Family family) {
    Fields f(res.fields);
    f.text("RE", "RE", 2);
    f.text(family == Family::V20 ? "RESTAG" : "RESID", res.resid, 25);
    f.number("RESVER", res.resver, 2);
    f.security(family, "RE", res.security);
    f.number("RESSHL", res.resshf.size(), 4);
    f.text("RESSHF", res.resshf, res.resshf.size());
    return f.bytes();
}

} // namespace nitfsample::detail
