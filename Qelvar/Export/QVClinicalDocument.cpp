#include "Qelvar/Export/QVClinicalDocument.h"

#include <algorithm>
#include <array>
#include <cstdio>

namespace {

constexpr const char* kLOINC = "2.16.840.1.113883.6.1";
constexpr const char* kSNOMED = "2.16.840.1.113883.6.96";

struct ObservationRow {
    int type;
    QVClinicalSection section;
    const char* code;
    const char* displayName;
};

constexpr auto Vitals = QVClinicalSection::Vitals;
constexpr auto Results = QVClinicalSection::Results;
constexpr std::array kObservations{
    ObservationRow{0, Vitals, "39156-5", "Body mass index"},
    ObservationRow{2, Vitals, "8302-2", "Height"},
    ObservationRow{3, Vitals, "3141-9", "Body weight Measured"},
    ObservationRow{5, Vitals, "8867-4", "Heart rate"},
    ObservationRow{14, Vitals, "2710-2", "Oxygen saturation"},
    ObservationRow{15, Results, "365812005", "Blood glucose level"},
    ObservationRow{16, Vitals, "8480-6", "Systolic blood pressure"},
    ObservationRow{17, Vitals, "8462-4", "Diastolic blood pressure"},
    ObservationRow{18, Results, "274776000", "Finding of alcohol in blood"},
    ObservationRow{19, Results, "248750004", "Peripheral blood flow"},
    ObservationRow{61, Vitals, "9279-1", "Respiratory rate"},
    ObservationRow{62, Vitals, "8310-5", "Body Temperature"},
    ObservationRow{71, Results, "106048009", "Respiratory finding"},
    ObservationRow{72, Results, "106048009", "Respiratory finding"},
    ObservationRow{73, Results, "106048009", "Respiratory finding"},
    ObservationRow{87, Results, "251853006", "Oral fluid input"},
};

const ObservationRow* observationFor(const VSObjectType* type) {
    const auto* const found = std::find_if(kObservations.begin(), kObservations.end(), [&](const auto& row) {
        return VSTypeCode{row.type} == type->code();
    });
    return found == kObservations.end() ? nullptr : found;
}

}  // namespace

QVClinicalSection QVClinicalSectionForType(const VSObjectType* type) {
    const ObservationRow* row = observationFor(type);
    return row ? row->section : QVClinicalSection::None;
}

QVClinicalDocument::QVClinicalDocument(const QVExportFile& file, int secondsFromGMT)
    : writer_(file), dates_(secondsFromGMT) {}

void QVClinicalDocument::start(const char* name, Attributes attributes) {
    writer_.startElement(name);
    for (const Attribute& attribute : attributes) writer_.attribute(attribute.name, attribute.value);
}

void QVClinicalDocument::leaf(const char* name, Attributes attributes) {
    start(name, attributes);
    end();
}

void QVClinicalDocument::open() {
    static const std::array<std::string, 3> kStyleSheet{R"(type="text/xsl")", " ", R"(href="CDA.xsl")"};
    writer_.startDocument(nullptr, nullptr);
    writer_.processingInstruction("xml-stylesheet", kStyleSheet);
    start("ClinicalDocument",
          {{"xmlns:xsi", "http://www.w3.org/2001/XMLSchema-instance"},
           {"xsi:schemaLocation",
            "urn:hl7-org:v3 ../../../CDA%20R2/cda-schemas-and-samples/infrastructure/cda/CDA.xsd"},
           {"xmlns", "urn:hl7-org:v3"},
           {"xmlns:cda", "urn:hl7-org:v3"},
           {"xmlns:sdtc", "urn:hl7-org:sdtc"},
           {"xmlns:fhir", "http://hl7.org/fhir/v3"}});
}

void QVClinicalDocument::writeCDAHeaderWithName(VSDate now, const std::string& name,
                                                const std::optional<VSBirthDate>& birthDate,
                                                int biologicalSex) {
    leaf("realmCode", {{"code", "US"}});
    leaf("typeId", {{"root", "2.16.840.1.113883.1.3"}, {"extension", "POCD_HD000040"}});
    leaf("templateId", {{"root", "2.16.840.1.113883.10.20.22.1.2"}});
    leaf("id", {{"extension", "Qelvar Export CDA"}, {"root", "1.1.1.1.1.1.1.1.1"}});
    leaf("code",
         {{"codeSystem", kLOINC}, {"codeSystemName", "LOINC"}, {"code", "34109-9"}, {"displayName", "Note"}});
    writer_.textElement("title", "Health Data Export");
    leaf("effectiveTime", {{"value", dates_.clinicalString(now)}});
    leaf("confidentialityCode", {{"code", "N"}, {"codeSystem", "2.16.840.1.113883.5.25"}});
    start("recordTarget");
    start("patientRole");
    leaf("id", {{"root", "2.16.840.1.113883.4.6"}, {"nullFlavor", "NA"}});
    start("patient");
    start("name", {{"use", "CL"}});
    writer_.text(name);
    end();
    if (biologicalSex == 1 || biologicalSex == 2) {
        leaf("administrativeGenderCode", {{"code", biologicalSex == 1 ? "F" : "M"},
                                          {"codeSystem", "2.16.840.1.113883.5.1"},
                                          {"displayName", biologicalSex == 1 ? "Female" : "Male"}});
    }
    char birthTime[40] = "";
    if (birthDate)
        std::snprintf(birthTime, sizeof birthTime, "%04d%02d%02d", birthDate->year, birthDate->month,
                      birthDate->day);
    leaf("birthTime", {{"value", birthTime}});
    end();  // patient
    end();  // patientRole
    end();  // recordTarget
}

// --- Sections -------------------------------------------------------------------------------------------

void QVClinicalDocument::writeCDAResultsHeader() {
    writeSectionHeader("2.16.840.1.113883.10.20.22.2.3.1", "30954-2", "RESULTS", "Results");
}

void QVClinicalDocument::writeCDAVitalHeader() {
    writeSectionHeader("2.16.840.1.113883.10.20.22.2.4.1", "8716-3", "VITAL SIGNS", "Vital Signs");
}

void QVClinicalDocument::writeSectionHeader(const char* templateRoot, const char* code,
                                            const char* displayName, const char* title) {
    start("component");
    start("section");
    leaf("templateId", {{"root", templateRoot}});
    leaf("code",
         {{"codeSystem", kLOINC}, {"codeSystemName", "LOINC"}, {"code", code}, {"displayName", displayName}});
    writer_.textElement("title", title);
    leaf("text", {});
}

void QVClinicalDocument::writeCDASectionFooter() {
    end();  // section
    end();  // component
}

// --- Organizers -----------------------------------------------------------------------------------------

void QVClinicalDocument::writeCDAVitalsOrganizerStartWithStartDate(VSDate startDate, VSDate endDate) {
    start("entry", {{"typeCode", "DRIV"}});
    start("organizer", {{"classCode", "CLUSTER"}, {"moodCode", "EVN"}});
    leaf("templateId", {{"root", "2.16.840.1.113883.10.20.22.4.26"}});
    leaf("id", {{"root", "c6f88320-67ad-11db-bd13-0800200c9a66"}});
    leaf("code", {{"code", "46680005"},
                  {"codeSystem", kSNOMED},
                  {"codeSystemName", "SNOMED CT"},
                  {"displayName", "Vital signs"}});
    leaf("statusCode", {{"code", "completed"}});
    writeEffectiveTime(startDate, endDate);
}

void QVClinicalDocument::writeCDAResultsOrganizerStart() {
    start("entry", {{"typeCode", "DRIV"}});
    start("organizer", {{"classCode", "BATTERY"}, {"moodCode", "EVN"}});
    leaf("templateId", {{"root", "2.16.840.1.113883.10.20.22.4.1"}});
    leaf("id", {{"root", "7d5a02b0-67a4-11db-bd13-0800200c9a66"}});
    leaf("code", {{"xsi:type", "CE"},
                  {"code", "386053000"},
                  {"displayName", "Result"},
                  {"codeSystem", kSNOMED},
                  {"codeSystemName", "SNOMED CT"}});
    leaf("statusCode", {{"code", "completed"}});
}

void QVClinicalDocument::writeCDAOrganizerEnd() {
    end();  // organizer
    end();  // entry
}

// --- Observations ---------------------------------------------------------------------------------------

void QVClinicalDocument::writeCDAEntryWithValue(const VSQuantitySample& sample, const VSUnit& unit) {
    const ObservationRow& row = *observationFor(sample.sampleType());
    const bool isVital = row.section == QVClinicalSection::Vitals;
    const std::string value = QVExportNumberText(sample.quantity().doubleValueForUnit(unit));

    start("component");
    start("observation", {{"classCode", "OBS"}, {"moodCode", "EVN"}});
    leaf("templateId", {{"root", "2.16.840.1.113883.10.20.22.4.27"}});
    leaf("id", {{"root", "c6f88321-67ad-11db-bd13-0800200c9a66"}});
    leaf("code", {{"code", row.code},
                  {"codeSystem", isVital ? kLOINC : kSNOMED},
                  {"codeSystemName", isVital ? "LOINC" : "SNOMED CT"},
                  {"displayName", row.displayName}});
    writeObservationText(sample, value, unit.description());
    leaf("statusCode", {{"code", "completed"}});
    writeEffectiveTime(sample.startDate(), sample.endDate());
    leaf("value", {{"xsi:type", "PQ"}, {"value", value.c_str()}, {"unit", unit.description().c_str()}});
    leaf("interpretationCode", {{"code", "N"}, {"codeSystem", "2.16.840.1.113883.5.83"}});
    end();  // observation
    end();  // component
}

void QVClinicalDocument::writeObservationText(const VSQuantitySample& sample, const std::string& value,
                                              const std::string& unit) {
    const VSSourceRevision& revision = sample.sourceRevision();
    const std::string& device = devices_.textOf(sample);
    start("text");
    writer_.textElement("sourceName", revision.source.name);
    if (!revision.version.empty()) writer_.textElement("sourceVersion", revision.version);
    if (!device.empty()) writer_.textElement("device", device);
    writer_.textElement("value", value);
    writer_.textElement("type", sample.sampleType()->identifier());
    writer_.textElement("unit", unit);
    for (const auto& [key, entry] : sample.metadata()) {
        start("metadataEntry");
        writer_.textElement("key", key);
        writer_.textElement("value", entry.description());
        end();
    }
    end();
}

void QVClinicalDocument::writeEffectiveTime(VSDate low, VSDate high) {
    start("effectiveTime");
    leaf("low", {{"value", dates_.clinicalString(low)}});
    leaf("high", {{"value", dates_.clinicalString(high)}});
    end();
}
