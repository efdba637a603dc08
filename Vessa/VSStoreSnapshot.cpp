#include "Vessa/VSStoreSnapshot.h"

#include <algorithm>
#include <queue>

#include "Vessa/VSHealthStoreConnection.h"
#include "Vessa/VSStoreCharacteristics.h"
#include "Vessa/VSStoreReader.h"
#include "Vessa/VSStoreSchema.h"

struct VSStoreSnapshot::Connection {
    Connection(std::filesystem::path storeFolder, VSDuration patience)
        : folder(std::move(storeFolder)),
          database(VSStoreSchema::openForReading(folder, patience)),
          reader(*database),
          transaction(*database, VSTransaction::Kind::Read) {
        reader.lastNumber();  // the moment of a reading transaction is that of its first reading
    }
    const std::filesystem::path folder;
    const std::unique_ptr<VSDatabase> database;
    VSStoreReader reader;
    VSTransaction transaction;
};

namespace {

/// Whether a stands behind b.
struct LaterEnd {
    bool operator()(const VSSampleRow& a, const VSSampleRow& b) const {
        return a.end() != b.end() ? a.end() > b.end() : a.id > b.id;
    }
};

/// Rows in the order of their start become rows in the order of their end: a row waits until every row that
/// is still to come ends later.
class EndOrder {
 public:
    using Emit = std::function<bool(const VSSampleRow&)>;
    explicit EndOrder(Emit emit) : emit_(std::move(emit)) {}
    bool add(const VSSampleRow& row) {
        while (!waiting_.empty() && waiting_.top().end() < row.start) {
            if (!emitFirst()) return false;
        }
        waiting_.push(row);
        return true;
    }
    void finish() {
        while (!waiting_.empty() && emitFirst()) {
        }
    }

 private:
    bool emitFirst() {
        const VSSampleRow row = waiting_.top();
        waiting_.pop();
        return emit_(row);
    }
    const Emit emit_;
    std::priority_queue<VSSampleRow, std::vector<VSSampleRow>, LaterEnd> waiting_;
};

void scanByEnd(VSDatabase& database, const VSObjectType* type, const EndOrder::Emit& emit) {
    auto rows = database.use("SELECT " VS_SAMPLE_COLUMNS " FROM samples WHERE type = ? ORDER BY start, id");
    rows.bind(1, VSTypeCodeValue(type->code()));
    EndOrder order(emit);
    while (rows.step()) {
        if (!order.add(VSReadSampleRow(rows))) return;
    }
    order.finish();
}

void scanByInsertion(VSDatabase& database, const VSObjectType* type, const EndOrder::Emit& emit) {
    auto rows = database.use("SELECT " VS_SAMPLE_COLUMNS
                             " FROM samples INDEXED BY samples_by_id WHERE type = ? ORDER BY id");
    rows.bind(1, VSTypeCodeValue(type->code()));
    while (rows.step() && emit(VSReadSampleRow(rows))) {
    }
}

}  // namespace

VSStoreSnapshot::VSStoreSnapshot(std::unique_ptr<Connection> connection)
    : connection_(std::move(connection)) {}

VSStoreSnapshot::~VSStoreSnapshot() = default;

VSResult<std::unique_ptr<VSStoreSnapshot>> VSStoreSnapshot::take(const VSHealthStore& store) {
    const auto* connection = dynamic_cast<const VSHealthStoreConnection*>(&store);
    if (!connection) return VSError{VSErrorCode::Refused, "not a store that can be read at one moment"};
    const VSStoreCore& core = connection->core();
    if (auto objection = core.access.objectionToManaging()) return *objection;
    try {
        return std::unique_ptr<VSStoreSnapshot>(
            new VSStoreSnapshot(std::make_unique<Connection>(core.folder, core.options.patience)));
    } catch (const VSDatabaseFailure& failure) {
        return VSErrorNamingStore(failure.error(), core.folder);
    }
}

template <typename Block>
auto VSStoreSnapshot::read(Block block) -> VSResult<decltype(block(std::declval<VSStoreReader&>()))> {
    try {
        return block(connection_->reader);
    } catch (const VSDatabaseFailure& failure) {
        return VSErrorNamingStore(failure.error(), connection_->folder);
    }
}

VSResult<std::optional<VSBirthDate>> VSStoreSnapshot::dateOfBirth() {
    return read([](VSStoreReader& reader) -> std::optional<VSBirthDate> {
        const auto value =
            VSReadCharacteristic(reader.database(), VSObjectType::dataTypeWithCode(VSCode::DateOfBirth));
        return value ? std::optional(VSBirthDateFromStored(*value)) : std::nullopt;
    });
}

VSResult<int> VSStoreSnapshot::characteristic(VSTypeCode code) {
    return read([code](VSStoreReader& reader) {
        const auto value = VSReadCharacteristic(reader.database(), VSObjectType::dataTypeWithCode(code));
        return static_cast<int>(value.value_or(0));
    });
}

VSResult<std::optional<VSMedicalIDData>> VSStoreSnapshot::medicalID() {
    return read([](VSStoreReader& reader) { return VSReadMedicalID(reader.database()); });
}

VSResult<std::map<const VSObjectType*, VSStoreSnapshot::Extent>> VSStoreSnapshot::extents() {
    return read([](VSStoreReader& reader) {
        std::map<const VSObjectType*, Extent> extents;
        for (const auto& [type, extent] : reader.extents()) {
            if (extent.count > 0) extents[type] = {extent.count, VSDate::fromMicroseconds(extent.lastEnd)};
        }
        return extents;
    });
}

VSResult<VSStoreSnapshot::Relations> VSStoreSnapshot::relations() {
    return read([](VSStoreReader& reader) {
        Relations relations;
        auto workouts = reader.database().use(
            "SELECT id FROM samples WHERE type = ? AND EXISTS (SELECT 1 FROM members WHERE parent = id) "
            "ORDER BY start + duration, id");
        workouts.bind(1, VSTypeCodeValue(VSCode::Workout));
        while (workouts.step())
            relations.workouts.emplace(VSObjectID(workouts.integer(0)),
                                       static_cast<int64_t>(relations.workouts.size()) + 1);
        std::unordered_set<VSObjectID> members;
        auto rows = reader.database().use("SELECT parent, member FROM members");
        while (rows.step()) {
            const VSObjectID member{rows.integer(1)};
            const auto workout = relations.workouts.find(VSObjectID(rows.integer(0)));
            if (workout != relations.workouts.end())
                relations.samplesOfWorkouts.emplace_back(member, workout->second);
            else if (!members.insert(member).second)
                relations.namedMembers.insert(member);
        }
        std::sort(relations.samplesOfWorkouts.begin(), relations.samplesOfWorkouts.end());
        for (const auto& [sample, workout] : relations.samplesOfWorkouts) {
            if (members.contains(sample)) relations.namedMembers.insert(sample);
        }
        return relations;
    });
}

VSStatus VSStoreSnapshot::readSamples(const VSObjectType* type, Order order, size_t pageSize,
                                      const PageHandler& handler) {
    const auto done = read([&](VSStoreReader& reader) {
        std::vector<VSSamplePtr> page;
        const auto emit = [&](const VSSampleRow& row) {
            page.push_back(reader.object(type, row));
            if (page.size() < pageSize) return true;
            return handler(std::exchange(page, {}));
        };
        if (order == Order::EndDate)
            scanByEnd(reader.database(), type, emit);
        else
            scanByInsertion(reader.database(), type, emit);
        if (!page.empty()) handler(std::move(page));
        return true;
    });
    return done ? VSStatus() : VSStatus(done.error());
}
