#include <gtest/gtest.h>

#include "StoreTestSupport.h"
#include "Vessa/VSSummaryQuery.h"

using namespace test;

namespace {

using Status = VSAuthorizationStatus;

struct StoreAuthorization : StoreTest {
    const VSSource band{"Band App", "org.example.band"};
    std::shared_ptr<VSHealthStore> theirs = openTheirs();

    std::shared_ptr<VSHealthStore> openTheirs() {
        VSHealthStore::Options options;
        options.applicationIdentifier = band.bundleIdentifier;
        options.applicationName = band.name;
        return openStore(folder.path(), options);
    }
    void TearDown() override {
        theirs.reset();
        store.reset();
    }
    VSProvenance own() const {
        VSProvenance provenance;
        provenance.sourceRevision = std::make_shared<VSSourceRevision>(VSSourceRevision{band, "1"});
        return provenance;
    }
    VSSamplePtr beat(double value, const VSProvenance& provenance) const {
        return quantity(heartRate(), value, "2020-03-01T08:00", "2020-03-01T08:00", provenance);
    }
    void grant(const VSObjectType* of, Status status) {
        EXPECT_OK(wait([&](auto done) {
            store->setAuthorizationStatuses({{of, status}}, band.bundleIdentifier, done);
        }));
    }
    void request(std::vector<const VSObjectType*> toShare, std::vector<const VSObjectType*> toRead) {
        EXPECT_OK(wait([&](auto done) { theirs->requestAuthorization(toShare, toRead, done); }));
    }
    std::vector<VSAuthorizationRecord> records(const VSObjectType* of) {
        return *answerOf<std::vector<VSAuthorizationRecord>>(
            [&](auto done) { store->authorizationRecords(of, done); });
    }
    std::vector<VSSource> sources() {
        return *answerOf<std::vector<VSSource>>([&](auto done) { store->allSources(done); });
    }
    /// 0: no error.
    static int refusal(const VSStatus& status) {
        if (status.ok()) return 0;
        EXPECT_EQ(status.error().code, VSErrorCode::Refused) << status.error().message;
        EXPECT_NE(status.error().message, "");
        return 1;
    }
    int reading(const VSObjectType* of, const VSPredicate& predicate = {}) {
        const auto samples = theirs->samples(of, predicate, 0, {});
        const auto statistics = theirs->statistics(of, predicate, VSStatisticsOptionDiscreteAverage);
        EXPECT_EQ(samples.ok(), statistics.ok());
        return samples.ok() ? 0 : refusal(samples.error());
    }
};

}  // namespace

TEST_F(StoreAuthorization, ProgramsReadAndShareWhatTheyMay) {
    save({beat(60, {})});
    VSPredicate ofBand;
    ofBand.sources = {band};
    EXPECT_TRUE(refusal(theirs->saveObjectsAndWait({beat(61, own())}))) << "never asked";
    EXPECT_TRUE(reading(heartRate()));
    request({heartRate()}, {heartRate(), steps()});
    EXPECT_TRUE(refusal(theirs->saveObjectsAndWait({beat(61, own())}))) << "asked, not answered";

    struct Case {
        Status status;
        bool shares, reads;
    };
    size_t saved = 0;
    for (const Case& c : {Case{Status::SharingOnly, true, false}, Case{Status::ReadingOnly, false, true},
                          Case{Status::SharingAndReading, true, true}, Case{Status::Neither, false, false}}) {
        grant(heartRate(), c.status);
        EXPECT_EQ(refusal(theirs->saveObjectsAndWait({beat(62, own())})), !c.shares);
        EXPECT_EQ(reading(heartRate()), !c.reads);
        EXPECT_EQ(reading(heartRate(), ofBand), 0) << "what it saved itself it sees";
        saved += c.shares;
    }
    EXPECT_EQ(count(VSCode::HeartRate), 1 + saved) << "the owner may do everything";
    EXPECT_EQ(theirs->samples(heartRate(), ofBand, 0, {})->size(), saved);
    EXPECT_TRUE(reading(steps())) << "of this type nothing was granted";
    expectSound(*store);
}

TEST_F(StoreAuthorization, NobodySpeaksOrActsForOthers) {
    save({beat(60, {})});
    const auto mine = allSamples(*store, heartRate());
    grant(heartRate(), Status::SharingAndReading);
    EXPECT_OK(theirs->saveObjectsAndWait({beat(61, own())}));
    EXPECT_TRUE(refusal(theirs->saveObjectsAndWait({beat(62, {})})));
    EXPECT_TRUE(refusal(theirs->saveObjectsAndWait({beat(62, own()), beat(63, from("Watch"))})));
    EXPECT_TRUE(refusal(wait([&](auto done) { theirs->deleteObjects(mine, done); })));
    const auto forged = std::make_shared<VSQuantitySample>(
        heartRate(), VSQuantity(heartRate()->canonicalUnit(), 60), mine[0]->startDate(), mine[0]->endDate(),
        own(), mine[0]->dataID());
    EXPECT_TRUE(refusal(wait([&](auto done) { theirs->deleteObject(forged, done); })));
    EXPECT_TRUE(
        refusal(wait([&](auto done) { theirs->deleteAllSamples({heartRate()}, std::nullopt, done); })));
    EXPECT_TRUE(refusal(wait([&](auto done) {
        theirs->setAuthorizationStatuses({{steps(), Status::SharingAndReading}}, band.bundleIdentifier, done);
    })));
    EXPECT_TRUE(refusal(wait([&](auto done) { theirs->setOrderedSources({band}, heartRate(), done); })));
    EXPECT_TRUE(refusal(wait([&](auto done) { theirs->updateMedicalIDData({}, done); })));
    EXPECT_TRUE(refusal(wait([&](auto done) { theirs->deleteMedicalIDData(done); })));
    EXPECT_FALSE(theirs->beginImport("theirs").ok());
    EXPECT_FALSE(theirs->undoBatch(1).ok());
    EXPECT_FALSE(theirs->dateOfBirth().ok());
    EXPECT_TRUE(refusal(wait([&](auto done) { theirs->setDateOfBirth(std::nullopt, done); })));
    grant(type(VSCode::DateOfBirth), Status::ReadingOnly);
    EXPECT_TRUE(theirs->dateOfBirth().ok());
    EXPECT_EQ(count(VSCode::HeartRate), 2u);
    EXPECT_OK(wait([&](auto done) { theirs->deleteAllSamples({heartRate()}, band.bundleIdentifier, done); }));
    EXPECT_EQ(count(VSCode::HeartRate), 1u);

    // A correlation needs what its members need.
    const auto reading = bloodPressure(120, 80, date("2020-03-01"), own());
    for (const VSTypeCode code :
         {VSCode::BloodPressure, VSCode::BloodPressureSystolic, VSCode::BloodPressureDiastolic}) {
        EXPECT_TRUE(refusal(theirs->saveObjectsAndWait({reading})));
        grant(type(code), Status::SharingOnly);
    }
    EXPECT_OK(theirs->saveObjectsAndWait({reading}));
    expectSound(*store);
}

TEST_F(StoreAuthorization, WhatMayNotBeReadIsNotCountedEither) {
    grant(heartRate(), Status::SharingOnly);
    save({quantity(heartRate(), 60, "2019-01-01", "2021-01-01", from("Watch")),
          quantity(steps(), 5, "2018-01-01", "2018-01-02")});
    EXPECT_OK(theirs->saveObjectsAndWait({beat(61, own())}));
    EXPECT_OK(wait([&](auto done) {
        store->setAuthorizationStatuses({{heartRate(), Status::ReadingOnly}}, "org.example.other", done);
    }));
    const auto told = [](auto& of, auto question) {
        Promise<std::string> promise;
        (of.*question)(heartRate(), [&](const auto& result) {
            promise.set(result.ok() ? std::to_string(result->size()) : VSErrorCodeName(result.error().code));
        });
        return *promise.wait();
    };
    VSPredicate ofBand;
    ofBand.sources = {band};
    for (const bool reads : {false, true}) {
        EXPECT_EQ(theirs->typeSummaries()->size(), reads ? 1u : 0u);
        const auto sources = theirs->sourceSummaries();
        ASSERT_EQ(sources->size(), reads ? 2u : 1u);
        EXPECT_EQ(sources->back().source, band);
        EXPECT_EQ(sources->back().firstStart, date("2020-03-01T08:00"));
        EXPECT_EQ(told(*theirs, &VSHealthStore::orderedSources), reads ? "2" : "refused");
        EXPECT_EQ(told(*theirs, &VSHealthStore::authorizationRecords), "1") << "their own";
        EXPECT_TRUE(refusal(theirs->check().ok() ? VSStatus() : VSStatus(theirs->check().error())));
        EXPECT_TRUE(refusal(theirs->batches().ok() ? VSStatus() : VSStatus(theirs->batches().error())));
        const auto extent = theirs->statistics(heartRate(), ofBand, VSStatisticsOptionDiscreteAverage);
        ASSERT_TRUE(extent.ok());
        EXPECT_EQ(extent->startDate, date("2020-03-01T08:00"));
        EXPECT_LE(extent->endDate, date("2020-03-01T08:01"));
        grant(heartRate(), Status::SharingAndReading);
    }
    EXPECT_EQ(told(*store, &VSHealthStore::authorizationRecords), "2");
    EXPECT_EQ(store->typeSummaries()->size(), 2u);
}

TEST_F(StoreAuthorization, WhatOthersSavedIsNotMadeAMember) {
    for (const VSTypeCode code :
         {VSCode::HeartRate, VSCode::BloodPressure, VSCode::BloodPressureSystolic, VSCode::Workout})
        grant(type(code), Status::SharingAndReading);
    const VSDate when = date("2020-03-01");
    const auto workout = [&](const VSProvenance& provenance, VSObjectID id = {}) {
        return plainWorkout(when, when, provenance, id);
    };
    save({quantity(type(VSCode::BloodPressureSystolic), 100, when, when), workout({})});
    const auto value = allSamples(*store, type(VSCode::BloodPressureSystolic))[0];
    const auto theirsNow = allSamples(*store, type(VSCode::Workout))[0];
    // What claims to be theirs, under the number of what is not.
    const auto forged = std::make_shared<VSQuantitySample>(
        value->sampleType(), VSQuantity(value->sampleType()->canonicalUnit(), 100), when, when, own(),
        value->dataID());
    EXPECT_TRUE(refusal(theirs->saveObjectsAndWait({bloodPressureOf({forged}, own())})));
    EXPECT_OK(theirs->saveObjectsAndWait({workout(own())}));
    const auto add = [&](VSSamplePtr sample, VSSamplePtr to) {
        return wait([&](auto done) { theirs->addSamplesToWorkout({sample}, to, done); });
    };
    EXPECT_TRUE(refusal(add(beat(60, own()), workout(own(), theirsNow->dataID()))));
    EXPECT_TRUE(refusal(add(forged, workout(own()))));
    EXPECT_OK(add(beat(60, own()), workout(own())));
    expectSound(*store);
}

TEST_F(StoreAuthorization, RecordsTellWhatWasAskedAndGranted) {
    request({heartRate()}, {});
    ASSERT_EQ(records(heartRate()).size(), 1u);
    EXPECT_EQ(records(heartRate())[0].source, band);
    EXPECT_EQ(records(heartRate())[0].status, Status::Undetermined);
    grant(heartRate(), VSInternalAuthorizationStatusMake(true, false));
    request({}, {heartRate()});  // more than before; what was granted stays
    const auto record = records(heartRate()).at(0);
    EXPECT_EQ(record.status, Status::SharingOnly);
    EXPECT_TRUE(record.requestedReading && record.requestedSharing);
    grant(steps(), Status::ReadingOnly);
    const auto unasked = records(steps()).at(0);
    EXPECT_EQ(unasked.source, band);
    EXPECT_FALSE(unasked.requestedReading || unasked.requestedSharing);
    EXPECT_FALSE(wait([&](auto done) {
                     store->setAuthorizationStatuses({{steps(), Status::Neither}},
                                                     VSSource::application().bundleIdentifier, done);
                 }).ok());
    EXPECT_OK(wait([&](auto done) { store->requestAuthorization({steps()}, {steps()}, done); }));
    EXPECT_EQ(records(steps()).size(), 1u) << "the owner has no record";

    // They survive, and so does who takes part.
    VSProvenance worn = from("Watch");
    worn.device = std::make_shared<VSDevice>(VSDevice{"W", {}, {}, {}, {}, {}, "one", {}});
    VSProvenance strapped = from("Watch");
    strapped.device = std::make_shared<VSDevice>(VSDevice{"Strap", {}, {}, {}, {}, {}, "two", {}});
    save({beat(1, worn), beat(2, strapped), beat(3, {}), beat(4, from("X"))});
    theirs.reset();
    store.reset();
    store = openStore(folder.path());
    EXPECT_EQ(records(heartRate()).at(0).status, Status::SharingOnly);
    const VSSource watch = VSSource::forImportedName("Watch"), x = VSSource::forImportedName("X");
    EXPECT_EQ(sources(), (std::vector{band, VSSource::application(), watch, x}));
    EXPECT_EQ(vs_sourcesForAuthorization(sources()), (std::vector{band}));
    EXPECT_EQ(vs_sourcesForDevices(sources()), (std::vector{VSSource::application(), watch, x}));
    const auto devices = [&](std::vector<std::string> identifiers) {
        return *answerOf<std::vector<VSDevice>>([&](auto done) { store->devices(identifiers, done); });
    };
    EXPECT_EQ(devices({}), (std::vector{*strapped.device, *worn.device}));
    EXPECT_EQ(devices({"one", "three"}), (std::vector{*worn.device}));
    EXPECT_EQ(devices({"three"}), std::vector<VSDevice>());
}

TEST_F(StoreAuthorization, RunningQueriesFeelEachChangeOfPermission) {
    save({beat(60, {}), quantity(steps(), 5, "2020-03-01", "2020-03-01")});
    grant(heartRate(), Status::ReadingOnly);
    Log<std::string> told;
    const auto tell = [&](const auto& result) {
        told.add(result.ok() ? std::to_string(result->added.size()) : VSErrorCodeName(result.error().code));
    };
    auto query =
        std::make_shared<VSAnchoredObjectQuery>(heartRate(), VSPredicate(), VSQueryAnchor{}, 0, tell);
    query->updateHandler = tell;
    theirs->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    grant(heartRate(), Status::Neither);
    ASSERT_TRUE(told.waitFor(2));
    save({beat(61, {})});
    ASSERT_TRUE(told.waitFor(3));
    grant(heartRate(), Status::ReadingOnly);
    ASSERT_TRUE(told.waitFor(4));
    EXPECT_EQ(told.entries(), (std::vector<std::string>{"1", "refused", "refused", "1"}));

    // Questions about all types are answered for those that may be read.
    Log<size_t> ranges, summaries;
    auto everything = std::make_shared<VSDateRangeQuery>([&](const auto& r) { ranges.add(r->size()); });
    theirs->executeQuery(everything);
    theirs->executeQuery(std::make_shared<VSSummaryQuery>(date("2020-03-01"), date("2020-03-02"),
                                                          [&](const auto& r) { summaries.add(r->size()); }));
    ASSERT_TRUE(ranges.waitFor(1) && summaries.waitFor(1));
    grant(steps(), Status::ReadingOnly);
    ASSERT_TRUE(ranges.waitFor(2));
    theirs.reset();
    EXPECT_EQ(ranges.entries(), (std::vector<size_t>{1, 2}));
    EXPECT_EQ(summaries.entries(), (std::vector<size_t>{1}));
}
