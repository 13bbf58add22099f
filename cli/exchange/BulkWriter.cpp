#include "exchange/BulkWriter.h"

#include "Failure.h"

namespace exchange {

namespace {

constexpr size_t kMostRecords = 250;
constexpr size_t kMostBytes = size_t{32} * 1024 * 1024;
constexpr const char* kWriting = "writing the imported items";

}  // namespace

void BulkWriter::add(NewRecord record) {
    mBytes += record.bytes;
    mRecords.push_back(std::move(record));
    if (mRecords.size() >= kMostRecords || mBytes >= kMostBytes) flush();
}

void BulkWriter::writeEach() {
    for (NewRecord& one : mRecords) {
        int id = 0;
        const int code = mCalls.insertOne(one.record.get(), &id, {});
        if (code == PLATFORM_ERROR_INVALID_PARAMETER) {
            mReport.skip(Skip::kUnread, one.title, one.line, "the store refuses it");
        } else {
            check(code, kWriting);
            mReport.countAdded(1);
        }
    }
}

void BulkWriter::flush() {
    std::vector<NewRecord> done;  // goes when all is written, whatever the way out
    if (!mRecords.empty() && !mIsDryRun) {
        calendar_list_h raw = nullptr;
        check(calendar_list_create(&raw), kWriting);
        const std::unique_ptr<platform::records::RecordList, decltype([](calendar_list_h list) {
                                  calendar_list_destroy(list, /*with_records=*/false);
                              })>
            list(raw);
        for (const NewRecord& one : mRecords) check(calendar_list_add(raw, one.record.get()), kWriting);
        const int code = mCalls.insertMany(raw, {});
        if (code == PLATFORM_ERROR_INVALID_PARAMETER) {
            writeEach();
        } else {
            check(code, kWriting);
        }
        if (code == PLATFORM_ERROR_NONE) mReport.countAdded(static_cast<int>(mRecords.size()));
    } else {
        mReport.countAdded(static_cast<int>(mRecords.size()));
    }
    done.swap(mRecords);
    mBytes = 0;
}

}  // namespace exchange
