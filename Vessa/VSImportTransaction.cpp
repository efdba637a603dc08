#include "Vessa/VSImportTransaction.h"

#include <algorithm>

#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSLog.h"
#include "Vessa/VSLimits.h"
#include "Vessa/VSStoreCharacteristics.h"
#include "Vessa/VSStoreSchema.h"

namespace {
constexpr size_t typeCodes = 128;
/// Opening waits for a migration at most; what writes to a store holds up nobody who opens it.
/// Records that others name. A document with more of them has made them up.
constexpr size_t mostNumbered = 1'000'000;
constexpr VSDuration patienceToOpen = std::chrono::seconds(10);

size_t codeOf(const VSSample& sample) {
    return static_cast<size_t>(VSTypeCodeValue(sample.sampleType()->code()));
}
}  // namespace

bool VSImportTransaction::Uses::has(int64_t id, Use use) const {
    const size_t byte = static_cast<size_t>(id) / 4;
    return byte < bits_.size() && (bits_[byte] >> (id % 4 * 2) & use);
}

void VSImportTransaction::Uses::set(int64_t id, Use use) {
    const size_t byte = static_cast<size_t>(id) / 4;
    if (byte >= bits_.size()) bits_.resize(byte + 1 + byte / 8);
    bits_[byte] = static_cast<uint8_t>(bits_[byte] | use << (id % 4 * 2));
}

VSNumberRanges VSImportTransaction::Uses::usedUpTo(int64_t last) const {
    VSNumberRanges used;
    for (int64_t id = 1; id <= last && static_cast<size_t>(id) / 4 < bits_.size(); ++id) {
        if (has(id, TopLevel) || has(id, Member)) used.append({id, id});
    }
    return used;
}

VSResult<std::unique_ptr<VSHealthStore::ImportTransaction>> VSImportTransaction::begin(
    std::shared_ptr<VSStoreCore> core, const std::string& name, VSDuration patience,
    const std::atomic<bool>* giveUp) {
    if (core->options.readOnly)
        return VSError{VSErrorCode::NotAccessible, "the store was opened for reading only"};
    try {
        auto database = VSStoreSchema::openForWriting(core->folder, false, core->options.survivesPowerLoss,
                                                      std::min(patience, patienceToOpen), giveUp);
        database->setPatience(patience);
        database->execute("PRAGMA cache_size = -32768");
        return std::unique_ptr<ImportTransaction>(
            new VSImportTransaction(std::move(core), std::move(database), name));
    } catch (const VSDatabaseFailure& failure) {
        return failure.error();
    }
}

VSImportTransaction::VSImportTransaction(std::shared_ptr<VSStoreCore> core,
                                         std::unique_ptr<VSDatabase> database, const std::string& name)
    : core_(std::move(core)),
      database_(std::move(database)),
      writer_(*database_),
      transaction_(std::make_unique<VSTransaction>(*database_, VSTransaction::Kind::Write)),
      name_(name),
      date_(VSEnvironment::current()->now()),
      hadSamples_(typeCodes),
      hasNewTopLevel_(typeCodes),
      hasNewMembers_(typeCodes) {
    database_->setGiveUp(nullptr);
    note_.emplace(core_->folder, VSStoreHolder::Work::Import, name_);
    writer_.begin();
    lastBefore_ = writer_.lastNumber();
    auto types = database_->use("SELECT DISTINCT type FROM type_sources");
    while (types.step()) hadSamples_[static_cast<size_t>(types.integer(0))] = true;
}

VSImportTransaction::~VSImportTransaction() {
    if (!transaction_) return;
    // What does not fit into memory is in the log already, also of an import that nobody wants any more.
    transaction_.reset();
    database_->setPatience(VSDuration(0));  // who is in the way ends some time, and then the cleaner comes
    try {
        VSCutLog(*database_);
    } catch (const VSDatabaseFailure& failure) {
        VSLog(VSLogLevel::Debug, "The store's log cannot be cut now: " + failure.error().message);
    }
    core_->filesChanged();
}

VSError VSImportTransaction::ended() const {
    return failure_.value_or(VSError{VSErrorCode::Invalid, "the import has ended"});
}

template <typename Block>
auto VSImportTransaction::attempt(Block block) -> VSResult<decltype(block())> {
    if (!transaction_ || failure_) return ended();
    try {
        return block();
    } catch (const VSDatabaseFailure& failure) {
        failure_ = failure.error();
        return *failure_;
    }
}

VSResult<VSHealthStore::ImportTransaction::Outcome> VSImportTransaction::add(
    const VSSample& sample, const VSImportRelations& relations) {
    if (transaction_ && !failure_) {
        if (auto objection = VSObjectionToSample(sample)) return *objection;
    }
    return attempt([&] {
        const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample);
        const Added added = correlation ? addCorrelation(*correlation, relations.members) : addRecord(sample);
        if (relations.number || !relations.workouts.empty()) relate(sample, added.id, relations);
        return added.outcome;
    });
}

/// Whether a row that this record may join can exist: else no search is needed.
bool VSImportTransaction::mayBePresent(const VSSample& sample, Use use) const {
    const size_t type = codeOf(sample);
    return hadSamples_[type] || (use == TopLevel ? hasNewMembers_[type] : hasNewTopLevel_[type]);
}

int64_t VSImportTransaction::insert(const VSSample& sample) {
    const int64_t id = writer_.insertAlone(sample, date_);
    writer_.matcher().added(sample, id);
    ++added_;
    return id;
}

VSImportTransaction::Added VSImportTransaction::addRecord(const VSSample& sample) {
    if (mayBePresent(sample, TopLevel)) {
        const int64_t found = writer_.matcher().findAmongMany(
            sample, TopLevel, [this](int64_t id) { return !uses_.has(id, TopLevel); });
        if (found) {
            uses_.set(found, TopLevel);
            return {found, found <= lastBefore_ ? Outcome::AlreadyPresent : Outcome::Added};
        }
    }
    const int64_t id = insert(sample);
    uses_.set(id, TopLevel);
    hasNewTopLevel_[codeOf(sample)] = true;
    return {id, Outcome::Added};
}

VSImportTransaction::Added VSImportTransaction::addCorrelation(const VSCorrelation& correlation,
                                                               const std::vector<int64_t>& memberNumbers) {
    const int64_t found = !hadSamples_[codeOf(correlation)]
                              ? 0
                              : writer_.matcher().findAmongMany(correlation, TopLevel, [this](int64_t id) {
                                    return id <= lastBefore_ && !uses_.has(id, TopLevel);
                                });
    if (found) {
        uses_.set(found, TopLevel);
        for (const VSMemberKey& member : writer_.matcher().members(found)) uses_.set(member.id, Member);
        return {found, Outcome::AlreadyPresent};
    }
    std::vector<VSMemberKey> members;
    for (const VSSamplePtr& object : correlation.objects()) {
        const size_t index = members.size();
        members.push_back(addMember(*object, index < memberNumbers.size() ? memberNumbers[index] : 0));
    }
    const int64_t id = insert(correlation);
    uses_.set(id, TopLevel);
    for (size_t index = 0; index < members.size(); ++index)
        writer_.insertMember(id, static_cast<int>(index), members[index]);
    return {id, Outcome::Added};
}

VSMemberKey VSImportTransaction::addMember(const VSSample& member, int64_t number) {
    const auto named = number ? numbered_.find(number) : numbered_.end();
    if (named != numbered_.end() && named->second.type == member.sampleType() &&
        writer_.matcher().isSame(member, named->second))
        return named->second;
    int64_t id = 0;
    if (mayBePresent(member, Member))
        id = writer_.matcher().findAmongMany(member, Member,
                                             [this](int64_t row) { return !uses_.has(row, Member); });
    if (!id) {
        id = insert(member);
        hasNewMembers_[codeOf(member)] = true;
    }
    uses_.set(id, Member);
    return {member.sampleType(), member.startDate().microseconds(), id};
}

/// Relations wait in `members` under the workout's number below zero, whatever their count: the workouts
/// stand at the end of a document.
void VSImportTransaction::relate(const VSSample& sample, int64_t id, const VSImportRelations& relations) {
    const VSMemberKey key{sample.sampleType(), sample.startDate().microseconds(), id};
    uses_.set(id, Member);  // a member of a correlation that means this one says so
    if (relations.number && numbered_.size() < mostNumbered) numbered_.try_emplace(relations.number, key);
    for (const int64_t workout : relations.workouts) {
        if (workout > 0 && pendingRelations_ < INT32_MAX)
            writer_.insertMember(-workout, pendingRelations_++, key);
    }
}

void VSImportTransaction::relateToWorkouts() {
    std::vector<std::pair<int64_t, int64_t>> workouts;  // number, id
    for (const auto& [number, key] : numbered_) {
        if (key.type == VSObjectType::workoutType()) workouts.emplace_back(number, key.id);
    }
    std::sort(workouts.begin(), workouts.end());
    for (const auto& [number, id] : workouts) {
        for (const VSMemberKey& member : writer_.matcher().members(-number)) {
            if (id > lastBefore_ || member.id > lastBefore_) writer_.addToWorkout(id, member);
        }
    }
    writer_.database().use("DELETE FROM members WHERE parent < 0").run();
    pendingRelations_ = 0;
}

VSStatus VSImportTransaction::endDocument() {
    const auto done = attempt([&] {
        if (pendingRelations_) relateToWorkouts();
        numbered_.clear();
        return true;
    });
    return done ? VSStatus() : VSStatus(done.error());
}

VSResult<int> VSImportTransaction::setCharacteristicsIfUnset(std::optional<VSBirthDate> birthDate,
                                                             int biologicalSex, int bloodType, int skinType) {
    return attempt([&] {
        int set = 0;
        const auto setUnset = [&](VSTypeCode code, int64_t value) {
            const auto* type = VSObjectType::dataTypeWithCode(code);
            if (!value) return;
            const auto current = VSReadCharacteristic(*database_, type);
            if (!current) {
                VSWriteCharacteristic(writer_, type, value);
                ++set;
            }
            if (current.value_or(value) == value)
                characteristics_.try_emplace(VSTypeCodeValue(code), VSBatchCharacteristic{value, !current});
        };
        if (birthDate) setUnset(VSCode::DateOfBirth, VSStoredBirthDate(*birthDate));
        setUnset(VSCode::BiologicalSex, biologicalSex);
        setUnset(VSCode::BloodType, bloodType);
        setUnset(VSCode::FitzpatrickSkinType, skinType);
        changedCharacteristics_ = changedCharacteristics_ || set;
        return set;
    });
}

VSResult<bool> VSImportTransaction::setMedicalIDIfUnset(const VSMedicalIDData& data) {
    if (auto objection = VSObjectionToMedicalID(data)) return *objection;
    return attempt([&] {
        const auto current = VSReadMedicalID(*database_);
        const bool isUnset = !current || *current == VSMedicalIDData();
        if (isUnset && current != data) {
            VSWriteMedicalID(*database_, data);
            changedCharacteristics_ = true;
        }
        if (isUnset || *current == data)
            characteristics_.try_emplace(VSBatchMedicalIDCode,
                                         VSBatchCharacteristic{VSBatchMedicalIDValue(data), isUnset});
        return isUnset && current != data;
    });
}

VSStatus VSImportTransaction::commit() {
    if (VSStatus status = endDocument(); !status) return status;
    try {
        const VSNewBatch batch{name_,
                               date_,
                               {lastBefore_ + 1, writer_.lastNumber()},
                               added_,
                               uses_.usedUpTo(lastBefore_),
                               characteristics_};
        if (!batch.isEmpty()) VSWriteBatch(*database_, batch);
        writer_.finish();
        note_.reset();
        transaction_->commit();
        transaction_.reset();
    } catch (const VSDatabaseFailure& failure) {
        failure_ = failure.error();
        transaction_.reset();
        return *failure_;
    }
    if (added_ || changedCharacteristics_) core_->committed();
    return {};
}
