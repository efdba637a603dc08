#include <gtest/gtest.h>
#include <libxml/parser.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <bit>
#include <map>
#include <set>

#include "ExportTestSupport.h"
#include "Qelvar/Import/QVRecordsImporter.h"
#include "Vessa/VSDatabase.h"
#include "Vessa/VSLimits.h"

// What is exported and imported into an empty store is what was there before, bit for bit, for every store
// that saving permits. RC_PARAMS=max_success=10000 tries ten thousand.

namespace {

namespace fs = std::filesystem;

int below(int count) {
    return *rc::gen::resize(100, rc::gen::inRange(0, count));
}
bool chance(int inHundred) {
    return below(100) < inHundred;
}
template <typename T>
const T& oneOf(const std::vector<T>& all) {
    return all[static_cast<size_t>(below(static_cast<int>(all.size())))];
}

const VSObjectType* type(VSTypeCode code) {
    return VSObjectType::dataTypeWithCode(code);
}

QVExportUnits unitsOfAPerson() {
    std::map<const VSObjectType*, VSUnit> units;
    for (const auto& [code, unit] :
         {std::pair(VSCode::BodyMass, "lb"), std::pair(VSCode::Height, "ft"),
          std::pair(VSCode::BloodGlucose, "mmol<180.1558>/L"), std::pair(VSCode::BodyTemperature, "degF"),
          std::pair(VSCode::DistanceWalkingRunning, "mi"), std::pair(VSCode::ActiveEnergyBurned, "kJ")})
        units.emplace(type(code), VSUnit::fromString(unit));
    return QVExportUnits(units);
}

/// Objects made up at random, of few enough times, origins and values that many are twins or nearly so, and
/// with texts that try to break out of a document.
class Maker {
 public:
    VSSamplePtr sample() {
        if (!made_.empty() && chance(15))
            return made_[static_cast<size_t>(below(static_cast<int>(made_.size())))]();
        const auto kind = below(10);
        if (kind == 0) return remember(workout());
        if (kind > 1) return remember(value());
        std::vector<VSSamplePtr> members{value()};
        while (chance(60)) members.push_back(value());
        return correlation(std::move(members));
    }
    VSSamplePtr correlation(std::vector<VSSamplePtr> members) const {
        const VSDate start = date();
        return std::make_shared<VSCorrelation>(type(VSCode::BloodPressure), start, start, std::move(members),
                                               provenance());
    }
    VSMedicalIDData medicalID() const {
        VSMedicalIDData data;
        for (auto* field : {&data.name, &data.medicalConditions, &data.medicalNotes, &data.allergyInfo,
                            &data.medicationInfo}) {
            if (chance(40)) *field = text();
        }
        if (chance(40)) data.birthdate = birthDate();
        if (chance(30)) data.pictureData.emplace(static_cast<size_t>(below(60'000)), uint8_t{0xD8});
        while (chance(40)) data.other[text()] = metadataValue(0);
        return data;
    }
    static VSBirthDate birthDate() { return {1 + below(9999), 1 + below(12), 1 + below(28)}; }

 private:
    VSSamplePtr remember(VSSamplePtr made) {
        made_.push_back([made]() -> VSSamplePtr {
            if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(made.get()))
                return std::make_shared<VSQuantitySample>(*quantity);
            if (const auto* category = dynamic_cast<const VSCategorySample*>(made.get()))
                return std::make_shared<VSCategorySample>(*category);
            return std::make_shared<VSWorkout>(dynamic_cast<const VSWorkout&>(*made));
        });
        return made;
    }
    static std::string text() {
        static const std::vector<std::string> kParts{"<",
                                                     "&",
                                                     "\"",
                                                     "'",
                                                     ">",
                                                     "]]>",
                                                     "?>",
                                                     "--",
                                                     "\n",
                                                     "\r\n",
                                                     "\t",
                                                     " ",
                                                     "\x01",
                                                     "\x7F",
                                                     ",",
                                                     ":",
                                                     "\\",
                                                     "name:",
                                                     "&#1;",
                                                     "0",
                                                     "%s",
                                                     "\xC2\x85",
                                                     "walk",
                                                     "\u00E9",
                                                     "\u200F",
                                                     "\uFFFE",
                                                     "\uFEFF",
                                                     "\uFFFD",
                                                     std::string(1, '\0'),
                                                     "\U0001F600"};
        std::string text;
        while (chance(70)) text += oneOf(kParts);
        return text;
    }
    static int64_t microseconds() { return chance(60) ? 0 : chance(50) ? 250'000 : below(1'000'000); }
    static VSDate date() {
        static const std::vector<VSDate> kDates{
            VSLimits::earliestDate,         VSLimits::latestDate - std::chrono::seconds(3),
            test::date("1582-10-10"),       test::date("1899-12-31T23:59:59"),
            test::date("2020-01-09T10:00"), test::date("2020-03-29T01:59:59Z"),
            test::date("2020-07-01"),       test::date("2031-01-01")};
        const VSDate day = chance(70) ? kDates[4 + static_cast<size_t>(below(3))] : oneOf(kDates);
        return day + std::chrono::seconds(below(2)) + VSDuration(microseconds());
    }
    static double number() {
        static const std::vector<double> kNumbers{
            0,       -0.0,      1,   58.1,    58.10000000000001, -273.15,     1e-300, 5e-324,
            1234567, 1234567.5, 0.1, 1.0 / 3, 0x1.8p46 + 1,      -0x1p47 + 1, 72};
        if (chance(70)) return oneOf(kNumbers);
        return std::ldexp(static_cast<double>(*rc::gen::arbitrary<int64_t>()), below(60) - 80);
    }
    static VSValue metadataValue(int depth) {
        switch (below(depth < 2 ? 9 : 7)) {
            case 0:
                return text();
            case 1:
                return chance(50);
            case 2:
                return *rc::gen::arbitrary<int64_t>();
            case 3:
                return chance(10) ? std::nan("") : number();
            case 4:
                return chance(10) ? VSDate::distantFuture() : date();
            case 5:
                return VSValue::Data{1, 2, static_cast<uint8_t>(below(256))};
            case 6:
                return chance(50) ? "1" : "";
            case 7:
                return VSValue::Array{metadataValue(depth + 1), metadataValue(depth + 1)};
            default:
                return VSValue::Dictionary{{text(), metadataValue(depth + 1)}};
        }
    }
    static VSSource source() {
        static const std::vector<std::string> kNames{"Watch", "Qelvar", "", "bell\x07"};
        VSSource source = VSSource::forImportedName(chance(80) ? oneOf(kNames) : text());
        if (chance(50))
            source.bundleIdentifier = chance(80) ? "com.example." + std::to_string(below(2)) : text();
        return source;
    }
    static VSProvenance provenance() {
        VSProvenance result;
        if (chance(80))
            result.sourceRevision =
                std::make_shared<VSSourceRevision>(VSSourceRevision{source(), chance(50) ? text() : ""});
        if (chance(50)) {
            VSDevice device;
            for (auto* field : {&device.name, &device.manufacturer, &device.model, &device.hardwareVersion,
                                &device.firmwareVersion, &device.softwareVersion, &device.localIdentifier,
                                &device.udiDeviceIdentifier})
                if (chance(30)) *field = text();
            result.device = std::make_shared<VSDevice>(device);
        }
        VSMetadata metadata;
        while (chance(30)) metadata[text()] = metadataValue(0);
        if (chance(20)) metadata[VSMetadataKeyWasUserEntered] = metadataValue(0);
        if (!metadata.empty()) result.metadata = std::make_shared<VSMetadata>(metadata);
        if (chance(90)) result.creationDate = date();
        if (chance(70)) result.timeZoneOffset = chance(50) ? 3600 : below(36 * 3600 + 1) - 18 * 3600;
        return result;
    }
    static VSSamplePtr value() {
        const auto types = VSObjectType::allTypes();
        const VSObjectType* of = types[static_cast<size_t>(below(static_cast<int>(types.size())))];
        if (chance(50) || (!of->isQuantityType() && !of->isCategoryType())) of = type(VSCode::BodyMass);
        const VSDate start = date();
        const VSDate end = std::max(start, chance(70) ? start : date());
        if (of->isQuantityType())
            return std::make_shared<VSQuantitySample>(of, VSQuantity(of->canonicalUnit(), number()), start,
                                                      end, provenance());
        const auto values = of->enumeratedValues();
        const int picked = values[static_cast<size_t>(below(static_cast<int>(values.size())))].first;
        return std::make_shared<VSCategorySample>(of, picked, start, end, provenance());
    }
    static VSSamplePtr workout() {
        const VSDate start = date(), end = std::max(start, date());
        std::optional<VSQuantity> energy, distance;
        if (chance(60)) energy = VSQuantity(VSUnit::kilocalorieUnit(), number());
        if (chance(60)) distance = VSQuantity(VSUnit::fromString("m"), number());
        std::vector<VSWorkoutEvent> events;
        while (chance(50))
            events.push_back({chance(80) ? 1 + below(2) : below(9) - 4,
                              chance(90) ? std::optional(date()) : std::nullopt});
        const VSDuration duration = chance(30)   ? VSDuration(0)
                                    : chance(90) ? VSDuration(*rc::gen::inRange<int64_t>(0, 10'000'000'000))
                                                 : VSLimits::latestDate - VSLimits::earliestDate;
        return std::make_shared<VSWorkout>(chance(80) ? 1 + below(57) : below(4000) - 100, start, end,
                                           duration, energy, distance, events, provenance());
    }

    std::vector<std::function<VSSamplePtr()>> made_;
};

std::string bits(double number) {
    return std::to_string(std::bit_cast<uint64_t>(number)) + " ";
}
std::string micros(std::optional<VSDate> date) {
    return date ? std::to_string(date->microseconds()) + " " : "- ";
}

/// Every field of a sample, but for its number and what it belongs to.
std::string fieldsOf(const VSSample& sample) {
    const auto& revision = sample.sourceRevision();
    VSValue::Array origin{revision.source.name, revision.source.bundleIdentifier, revision.version,
                          sample.metadata()};
    if (const VSDevice* device = sample.device()) {
        for (const auto* field :
             {&device->name, &device->manufacturer, &device->model, &device->hardwareVersion,
              &device->firmwareVersion, &device->softwareVersion, &device->localIdentifier,
              &device->udiDeviceIdentifier})
            origin.push_back(*field ? VSValue(**field) : VSValue(false));
    }
    std::string text = std::string(sample.sampleType()->name()) + " " + micros(sample.startDate()) +
                       micros(sample.endDate()) + micros(sample.creationDate()) +
                       std::to_string(sample.timeZoneOffset().value_or(999'999)) + " " +
                       VSValue(origin).serialized() + " ";
    if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample))
        text += quantity->quantity().unit().unitString() + bits(quantity->quantity().value());
    if (const auto* category = dynamic_cast<const VSCategorySample*>(&sample))
        text += std::to_string(category->value());
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) {
        text += std::to_string(workout->workoutActivityType()) + " " +
                std::to_string(workout->duration().count());
        for (const auto& total : {workout->totalDistance(), workout->totalEnergyBurned()})
            text += total ? " " + total->unit().unitString() + bits(total->value()) : " -";
        for (const auto& event : workout->workoutEvents())
            text += std::to_string(event.type) + "@" + micros(event.date);
    }
    return text;
}

using Content = std::multiset<std::string>;

/// All that a store holds: each object with its members in their order, and with what it belongs to.
Content contentOf(VSHealthStore& store) {
    std::map<int64_t, std::string> fields;
    for (const VSObjectType* of : VSObjectType::allTypes()) {
        if (!of->isSampleType()) continue;
        const auto samples = store.samples(of, {}, VSObjectQueryNoLimit, {});
        for (const auto& sample : *samples) fields[VSObjectIDValue(sample->dataID())] = fieldsOf(*sample);
    }
    VSDatabase database(store.folder() / "vessa.sqlite", VSDatabase::Mode::Read, std::chrono::seconds(10));
    std::map<int64_t, std::string> members;
    std::map<int64_t, std::multiset<std::string>> ofWorkout, parents;
    auto rows = database.use(
        "SELECT parent, member, parent IN (SELECT workout FROM workouts) FROM members ORDER BY parent, "
        "position");
    while (rows.step()) {
        const int64_t parent = rows.integer(0), member = rows.integer(1);
        parents[member].insert(fields.at(parent));
        if (rows.integer(2))
            ofWorkout[parent].insert(fields.at(member));
        else
            members[parent] += "\n  member " + fields.at(member);
    }
    Content content;
    for (const auto& [id, text] : fields) {
        std::string whole = text + members[id];
        for (const auto& sample : ofWorkout[id]) whole += "\n  sample " + sample;
        for (const auto& parent : parents[id]) whole += "\n  of " + parent;
        content.insert(whole);
    }
    const auto born = *store.dateOfBirth();
    content.insert("born " +
                   (born ? std::to_string(born->year * 10000 + born->month * 100 + born->day) : ""));
    content.insert("is " + std::to_string((*store.biologicalSex() * 10 + *store.bloodType()) * 10 +
                                          *store.fitzpatrickSkinType()));
    test::Promise<std::string> medicalID;
    store.fetchMedicalIDData([&](const auto& answer) {
        const auto& data = *answer;
        VSValue::Array texts;
        if (data) {
            for (const auto* field : {&data->name, &data->medicalConditions, &data->medicalNotes,
                                      &data->allergyInfo, &data->medicationInfo})
                texts.push_back(*field ? VSValue(**field) : VSValue(false));
            texts.push_back(data->birthdate ? data->birthdate->year * 10000 + data->birthdate->month * 100 +
                                                  data->birthdate->day
                                            : 0);
            texts.push_back(data->pictureData ? VSValue(*data->pictureData) : VSValue(false));
            texts.push_back(data->other);
        }
        medicalID.set(VSValue(texts).serialized());
    });
    content.insert("Medical ID " + *medicalID.wait());
    return content;
}

std::shared_ptr<VSHealthStore> openStore(const fs::path& folder) {
    VSHealthStore::Options options;
    options.survivesPowerLoss = false;
    const auto store = VSHealthStore::open(folder, options);
    if (!store) throw std::runtime_error(store.error().message);
    return *store;
}

VSStatus wait(const std::function<void(VSHealthStore::Completion)>& change) {
    test::Promise<VSStatus> done;
    change([&](const VSStatus& status) { done.set(status); });
    return *done.wait();
}

/// As a person and several programs fill it.
void fill(VSHealthStore& store) {
    Maker maker;
    std::vector<VSSamplePtr> samples;
    for (int count = below(14); count > 0; --count) samples.push_back(maker.sample());
    const auto saved = store.saveObjectsAndWait(samples);
    if (!saved) RC_FAIL(saved.error().message);
    std::vector<VSSamplePtr> values, workouts;
    for (const VSObjectType* of : VSObjectType::allTypes()) {
        if (!of->isSampleType()) continue;
        const auto all = store.samples(of, {}, VSObjectQueryNoLimit, {});
        for (const auto& sample : *all)
            (of->kind() == VSTypeKind::Workout ? workouts : values).push_back(sample);
    }
    std::erase_if(values,
                  [](const auto& sample) { return dynamic_cast<const VSCorrelation*>(sample.get()); });
    if (values.empty()) return;
    while (chance(40)) {  // which share members with others, or hold one twice
        std::vector<VSSamplePtr> members{oneOf(values)};
        while (chance(50)) members.push_back(oneOf(values));
        RC_ASSERT(store.saveObjectsAndWait({maker.correlation(members)}).ok());
    }
    while (!workouts.empty() && chance(70)) {
        RC_ASSERT(wait([&](auto done) {
                      store.addSamplesToWorkout({oneOf(values), oneOf(values)}, oneOf(workouts), done);
                  }).ok());
    }
    if (chance(50)) RC_ASSERT(wait([&](auto done) { store.setDateOfBirth(Maker::birthDate(), done); }).ok());
    RC_ASSERT(
        wait([&](auto done) { store.setCharacteristic(type(VSCode::BloodType), below(9), done); }).ok());
    if (chance(50))
        RC_ASSERT(wait([&](auto done) { store.updateMedicalIDData(maker.medicalID(), done); }).ok());
}

/// Whether the document is what its own declaration says.
bool isValid(const fs::path& document) {
    xmlParserCtxtPtr context = xmlNewParserCtxt();
    xmlDocPtr tree = xmlCtxtReadFile(context, document.c_str(), nullptr,
                                     XML_PARSE_DTDVALID | XML_PARSE_NOERROR | XML_PARSE_NOWARNING);
    const bool valid = tree && context->valid;
    xmlFreeDoc(tree);
    xmlFreeParserCtxt(context);
    return valid;
}

struct Place {
    const char *zone, *locale;
};
const std::vector<Place> kPlaces{{"Asia/Kathmandu", "ar_EG"},
                                 {"America/St_Johns", "en_US"},
                                 {"Europe/Copenhagen", "de_DE"},
                                 {"America/New_York", "hi_IN"},
                                 {"Pacific/Kiritimati", "th_TH"}};

/// A document without its date.
std::string datelessText(const fs::path& document) {
    std::string text = test::contentOf(document);
    for (const char* dated : {"<ExportDate value=", "<effectiveTime value="}) {
        if (const size_t at = text.find(dated); at != std::string::npos)
            text.erase(at, text.find('>', at) - at);
    }
    return text;
}

struct Trip {
    explicit Trip(const std::shared_ptr<VSHealthStore>& store, const fs::path& folder, const std::string& now,
                  const Place& place, const QVExportUnits& units)
        : environment(now, place.zone, place.locale), manager(test::exportSetting(store, folder, units)) {
        const auto made = test::exportAll(manager);
        if (!made) throw std::runtime_error(made.error().message);
        archive = *made;
    }
    const test::FixedEnvironment environment;
    QVExportManager manager;
    fs::path archive;
};

/// Imports the archive; all that it holds must be added, or all be there already.
void import(const std::shared_ptr<VSHealthStore>& store, const fs::path& archive, bool isThere) {
    const auto report = QVRecordsImporter(store).importFiles({archive});
    if (!report) throw std::runtime_error(report.error().message);
    for (const auto& refusal : report->refusals) throw std::runtime_error(refusal.description());
    if ((isThere ? report->total.added : report->total.alreadyHad) != 0)
    {
        std::string text = "added:";
        for (const auto& [type, count] : report->byType)
            if (count.added > 0) text += " " + std::to_string(count.added) + " " + type;
        throw std::runtime_error(text + test::contentOf(archive.parent_path() / "export" / "export.xml"));
    }
}

void expectSame(const Content& actual, const Content& expected, const std::string& what) {
    if (actual == expected) return;
    std::string text = what;
    for (const auto& line : expected)
        if (!actual.contains(line)) text += "\nlost: " + line;
    for (const auto& line : actual)
        if (!expected.contains(line)) text += "\nmade: " + line;
    throw std::runtime_error(text);
}

/// A store against what comes back of it, wherever it is exported and imported.
void expectIdentity(const std::shared_ptr<VSHealthStore>& store, const fs::path& folder, const Place& from,
                    const Place& to, const QVExportUnits& units, bool mayBeInvalid) {
    const Content before = contentOf(*store);
    const Trip first(store, folder / "first", "2020-07-02T12:00", from, units);
    if (!mayBeInvalid && !isValid(first.manager.paths().filePath)) throw std::runtime_error("not valid");
    const auto other = openStore(folder / "imported");
    {
        const test::FixedEnvironment there("2021-01-02T12:00", to.zone, to.locale);
        import(other, first.archive, false);
        expectSame(contentOf(*other), before, "imported into an empty store");
        import(store, first.archive, true);
    }
    expectSame(contentOf(*store), before, "imported into its own store");
    if (!(*other->check()).problems.empty()) throw std::runtime_error((*other->check()).problems.front());
    const Trip second(other, folder / "second", "2020-07-03T12:00", from, units);
    for (const auto file : {&QVExportPaths::filePath, &QVExportPaths::CDAFilePath}) {
        const auto text = [&](const Trip& trip) { return Content{datelessText(trip.manager.paths().*file)}; };
        expectSame(text(second), text(first), "exported again");
    }
}

RC_GTEST_PROP(RoundTrip, IsTheIdentityForEveryStore, ()) {
    const test::FixedEnvironment environment("2020-07-01T12:00");
    const test::TemporaryFolder folder;
    const auto store = openStore(folder.path() / "store");
    fill(*store);
    const QVExportUnits units = chance(50) ? unitsOfAPerson() : QVExportUnits();
    expectIdentity(store, folder.path(), oneOf(kPlaces), oneOf(kPlaces), units, true);
}

/// And strict readers that none of us wrote take the documents.
TEST(RoundTripOfRealRecords, IsTheIdentity) {
    const test::FixedEnvironment environment("2020-07-01T12:00");
    const test::TemporaryFolder folder;
    const auto store = openStore(folder.path() / "store");
    const fs::path data = fs::path(QELVAR_TEST_DATA) / "import";
    import(store, data / "wrist-two-days" / "input.zip", false);
    import(store, data / "every-kind" / "input.xml", false);
    expectIdentity(store, folder.path(), kPlaces[3], kPlaces[2], unitsOfAPerson(), false);
    const Trip trip(store, folder.path() / "third", "2026-07-02T12:00", kPlaces[0], unitsOfAPerson());
    test::expectAccepted("xmllint --stream --noout --valid '" + trip.manager.paths().filePath.string() + "'");
    test::expectAccepted("xmllint --stream --noout '" + trip.manager.paths().CDAFilePath.string() + "'");
    test::expectAccepted("unzip -tqq '" + trip.archive.string() + "'");
    test::expectAccepted(
        "python3 -c 'import sys, zipfile, xml.etree.ElementTree as tree\n"
        "archive = zipfile.ZipFile(sys.argv[1])\n"
        "[tree.parse(archive.open(name)) for name in archive.namelist()]' '" +
        trip.archive.string() + "'");
}

}  // namespace
