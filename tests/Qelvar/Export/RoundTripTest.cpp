#include <algorithm>
#include <random>
#include <set>

#include "ExportTestSupport.h"
#include "Qelvar/Import/QVRecordsImporter.h"

// What is exported and imported into an empty store is what was there before, whatever the texts hold.

namespace {

namespace fs = std::filesystem;

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

/// A store's content made up at random, with texts that try to break out of a document.
class HostileStore {
 public:
    HostileStore(unsigned seed, bool beyondTheDeclaration) : random_(seed), beyond_(beyondTheDeclaration) {}

    std::vector<VSSamplePtr> samples(int count) {
        std::vector<VSSamplePtr> samples;
        for (int i = 0; i < count; ++i) {
            samples.push_back(sample());
            if (chance(10)) samples.push_back(samples[index(samples.size())]);
        }
        return samples;
    }
    std::string text() {
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
                                                     "\xF0\x9F\x98\x80",
                                                     "\x01",
                                                     "\x1F",
                                                     "\x7F",
                                                     "\xC2\x85",
                                                     "\xE2\x80\xA8",
                                                     "\xEF\xBF\xBE",
                                                     "\xE2\x80\x8F",
                                                     "\xE2\x80\xAE",
                                                     "\xC3\xA9",
                                                     ",",
                                                     ":",
                                                     "\\",
                                                     "name:",
                                                     "&amp;",
                                                     "&#1;",
                                                     "\xEF\xBB\xBF",
                                                     std::string(1, '\0'),
                                                     "walk",
                                                     "0",
                                                     "%s"};
        std::string text;
        for (size_t n = 1 + number(6); n > 0; --n) text += kParts[index(kParts.size())];
        return text;
    }
    VSBirthDate birthDate() {
        return {1900 + static_cast<int>(number(120)), 1 + static_cast<int>(number(12)), 28};
    }
    size_t index(size_t below) { return random_() % below; }
    int number(size_t below) { return static_cast<int>(index(below)); }

 private:
    bool chance(int inHundred) { return number(100) < inHundred; }

    VSDate date() {
        return VSDate::fromMicroseconds(int64_t(random_() % 3'000'000'000'000'000) - 2'000'000'000'000'000);
    }

    VSValue value(int depth = 0) {
        switch (number(depth < 2 ? 9 : 7)) {
            case 0:
                return text();
            case 1:
                return chance(50);
            case 2:
                return int64_t(random_());
            case 3:
                return std::ldexp(double(random_()), number(80) - 90);
            case 4:
                return date();
            case 5:
                return VSValue::Data{1, 2, static_cast<uint8_t>(number(256))};
            case 6:
                return chance(50) ? "1" : "";
            case 7:
                return VSValue::Array{value(depth + 1), value(depth + 1)};
            default:
                return VSValue::Dictionary{{text(), value(depth + 1)}};
        }
    }

    VSProvenance provenance() {
        VSProvenance result;
        if (chance(80)) {
            result.sourceRevision = std::make_shared<VSSourceRevision>(
                VSSourceRevision{VSSource::forImportedName(text()), chance(50) ? text() : ""});
        }
        if (chance(50)) {
            VSDevice device;
            for (auto* field : {&device.name, &device.manufacturer, &device.model, &device.hardwareVersion,
                                &device.firmwareVersion, &device.softwareVersion, &device.localIdentifier,
                                &device.udiDeviceIdentifier})
                if (chance(40)) *field = text();
            device.name = text();
            result.device = std::make_shared<VSDevice>(device);
        }
        VSMetadata metadata;
        for (int n = number(4); n > 0; --n) metadata[text()] = value();
        if (chance(20)) metadata[VSMetadataKeyWasUserEntered] = value();
        if (!metadata.empty()) result.metadata = std::make_shared<VSMetadata>(metadata);
        result.creationDate = date();
        result.timeZoneOffset = (number(29) - 14) * 3600;
        return result;
    }

    VSSamplePtr value(const VSObjectType* of) {
        const VSDate start = date(),
                     end = start + VSDuration(int64_t(random_() % 100'000'000) * number(1000));
        if (of->isCategoryType()) {
            const auto values = of->enumeratedValues();
            return std::make_shared<VSCategorySample>(of, values[index(values.size())].first, start, end,
                                                      provenance());
        }
        double amount = std::ldexp(double(random_() % 1'000'000'007), number(60) - 50);
        if (!of->isCumulative() && chance(20)) amount = -amount;
        return std::make_shared<VSQuantitySample>(of, VSQuantity(of->canonicalUnit(), amount), start, end,
                                                  provenance());
    }

    VSSamplePtr sample() {
        const auto types = VSObjectType::allTypes();
        while (true) {
            const VSObjectType* of = types[index(types.size())];
            if (of->isQuantityType() || of->isCategoryType()) return value(of);
            if (of->kind() == VSTypeKind::Workout) return workout();
            if (of->kind() != VSTypeKind::Correlation) continue;
            std::vector<VSSamplePtr> members;
            for (int n = 1 + number(3); n > 0; --n) members.push_back(value(type(VSCode::HeartRate)));
            const VSDate start = date();
            return std::make_shared<VSCorrelation>(of, start, start, members, provenance());
        }
    }

    VSSamplePtr workout() {
        const VSDate start = date(), end = start + std::chrono::hours(number(5));
        std::optional<VSQuantity> energy, distance;
        if (chance(60)) energy = VSQuantity(VSUnit::kilocalorieUnit(), number(5000) / 7.0);
        if (chance(60)) distance = VSQuantity(VSUnit::fromString("m"), number(3) * 1000.0 / 3);
        std::vector<VSWorkoutEvent> events;
        for (int n = number(3); n > 0; --n) events.push_back({beyond_ ? number(9) : 1 + number(2), date()});
        if (beyond_) events.push_back({1, std::nullopt});
        const int activity = beyond_ ? 100 + number(9) : 1 + number(57);
        return std::make_shared<VSWorkout>(activity, start, end, VSDuration(random_() % 10'000'000'000),
                                           energy, distance, events, provenance());
    }

    std::mt19937_64 random_;
    const bool beyond_;
};

int64_t second(VSDate date) {
    return (date.microseconds() - (date.microseconds() % 1'000'000 + 1'000'000) % 1'000'000) / 1'000'000;
}

/// Where the sample was recorded, when that was not at home: "" else.
std::string journey(const VSSample& sample) {
    for (int day = -240; day <= 240; day += 5) {
        const VSDate near = sample.startDate() + std::chrono::hours(24 * day);
        if (VSCalendar::current().secondsFromGMT(near) == sample.timeZoneOffset()) return "";
    }
    return " | " + std::to_string(*sample.timeZoneOffset());
}

/// All that a document says of a sample, and no more.
std::string textOf(const VSSample& sample, const QVExportUnits& units) {
    std::ostringstream text;
    text.precision(15);
    const auto& revision = sample.sourceRevision();
    text << sample.sampleType()->name() << ' ' << second(sample.startDate()) << ' '
         << second(sample.endDate()) << ' ' << second(*sample.creationDate()) << " | " << revision.source.name
         << " | " << revision.version << " | ";
    text << (sample.device() ? sample.device()->description() : "") << journey(sample);
    text << " | " << VSValue(sample.metadata()).serialized() << " | ";
    const auto total = [&](const std::optional<VSQuantity>& quantity) {
        if (quantity) text << quantity->value();
        text << ';';
    };
    if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample)) {
        char number[40];
        std::snprintf(
            number, sizeof number, "%g",
            quantity->quantity().doubleValueForUnit(units.preferredUnitForObjectType(sample.sampleType())));
        text << number;
    } else if (const auto* category = dynamic_cast<const VSCategorySample*>(&sample)) {
        text << category->value();
    } else if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) {
        text << workout->workoutActivityType() << ' ' << workout->duration().count() << ' ';
        total(workout->totalDistance());
        total(workout->totalEnergyBurned());
        for (const auto& event : workout->workoutEvents())
            text << event.type << '@' << (event.date ? std::to_string(second(*event.date)) : "") << ' ';
    } else if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample)) {
        std::multiset<std::string> members;
        for (const auto& member : correlation->objects()) members.insert(textOf(*member, units));
        for (const auto& member : members) text << "\n  " << member;
    }
    return text.str();
}

std::multiset<std::string> contentOf(VSHealthStore& store, const QVExportUnits& units) {
    std::multiset<std::string> content;
    for (const VSObjectType* of : VSObjectType::allTypes()) {
        if (!of->isSampleType()) continue;
        const auto samples = store.samples(of, {}, VSObjectQueryNoLimit, {});
        EXPECT_TRUE(samples.ok());
        for (const auto& sample : *samples) content.insert(textOf(*sample, units));
    }
    const auto born = store.dateOfBirth();
    content.insert("born " + (*born ? std::to_string((*born)->year) : ""));
    content.insert("is " + std::to_string((*store.biologicalSex() * 10 + *store.bloodType()) * 10 +
                                          *store.fitzpatrickSkinType()));
    return content;
}

std::shared_ptr<VSHealthStore> openStore(const fs::path& folder) {
    VSHealthStore::Options options;
    options.survivesPowerLoss = false;
    const auto store = VSHealthStore::open(folder, options);
    EXPECT_TRUE(store.ok());
    return *store;
}

struct Place {
    const char *zone, *locale;
};
class RoundTrip : public testing::TestWithParam<Place> {
 protected:
    /// Exports the store, has others read the documents, imports them and compares.
    void expectSame(const std::shared_ptr<VSHealthStore>& store, const QVExportUnits& units, bool isValid) {
        QVExportManager manager(test::exportSetting(store, folder_.path() / "documents", units));
        const auto archive = test::exportAll(manager);
        ASSERT_TRUE(archive.ok()) << archive.error().message;
        const std::string records = "'" + manager.paths().filePath.string() + "'";
        const std::string clinical = "'" + manager.paths().CDAFilePath.string() + "'";
        test::expectAccepted("xmllint --stream --noout " + std::string(isValid ? "--valid " : "") + records);
        test::expectAccepted("xmllint --stream --noout " + clinical);
        test::expectAccepted("unzip -tqq '" + archive->string() + "'");
        test::expectAccepted(
            "python3 -c 'import sys, zipfile, xml.etree.ElementTree as tree\n"
            "archive = zipfile.ZipFile(sys.argv[1])\n"
            "[tree.parse(archive.open(name)) for name in archive.namelist()]' '" +
            archive->string() + "'");
        const auto empty = openStore(folder_.path() / "imported");
        const auto report = QVRecordsImporter(empty).importFiles({*archive});
        ASSERT_TRUE(report.ok()) << report.error().message;
        for (const auto& refusal : report->refusals) ADD_FAILURE() << refusal.description();
        EXPECT_EQ(contentOf(*empty, units), contentOf(*store, units));
    }
    const test::FixedEnvironment environment_{"2026-07-02T12:00", GetParam().zone, GetParam().locale};
    const test::TemporaryFolder folder_;
};

TEST_P(RoundTrip, KeepsAHostileStore) {
    for (const bool beyond : {false, true}) {
        HostileStore hostile(static_cast<unsigned>(GetParam().zone[1]) + beyond, beyond);
        const fs::path folder = folder_.path() / std::to_string(beyond);
        const auto store = openStore(folder);
        ASSERT_TRUE(store->saveObjectsAndWait(hostile.samples(300)).ok());
        VSMedicalIDData medicalID;
        medicalID.name = hostile.text();
        store->updateMedicalIDData(medicalID, {});
        store->setDateOfBirth(hostile.birthDate(), {});
        test::Promise<bool> saved;
        store->setCharacteristic(type(VSCode::BloodType), 1 + hostile.number(8),
                                 [&](const VSStatus& status) { saved.set(status.ok()); });
        ASSERT_TRUE(*saved.wait());
        expectSame(store, unitsOfAPerson(), !beyond);
        fs::remove_all(folder_.path() / "imported");
    }
}

TEST_P(RoundTrip, KeepsRealRecords) {
    const auto store = openStore(folder_.path() / "store");
    const fs::path data = fs::path(QELVAR_TEST_DATA) / "import";
    ASSERT_TRUE(QVRecordsImporter(store)
                    .importFiles({data / "wrist-two-days" / "input.zip", data / "every-kind" / "input.xml"})
                    .ok());
    expectSame(store, unitsOfAPerson(), true);
}

INSTANTIATE_TEST_SUITE_P(, RoundTrip,
                         testing::Values(Place{"Asia/Kathmandu", "ar_EG"}, Place{"America/St_Johns", "en_US"},
                                         Place{"Europe/Berlin", "de_DE"}, Place{"Pacific/Apia", "th_TH"}),
                         [](const auto& place) { return std::string(place.param.locale); });

}  // namespace
