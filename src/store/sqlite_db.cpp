#include "store/sqlite_db.h"

#include <sqlite3.h>

#include <algorithm>
#include <chrono>

#include "common/utf.h"

namespace asum {
namespace {

// Waits stay short: the processing thread commits each alert on its own and
// locks again right after, so a waiting reader only gets in through the short
// gaps between commits; a reader that slept 100 ms at a time could miss every
// gap for seconds. A probe every few milliseconds costs next to nothing.
constexpr int kBusyStepsMs[] = {1, 1, 2, 2, 3, 5};

}  // namespace

std::u16string UpToFirstNul(const std::u16string& text) {
  const size_t nul = text.find(u'\0');
  return nul == std::u16string::npos ? text : text.substr(0, nul);
}

CDbSQLite::~CDbSQLite() { Close(); }

int CDbSQLite::OnBusy(void* self, int attempts) {
  BusyBudget* budget = static_cast<CDbSQLite*>(self)->budget_;
  if (budget == nullptr || budget->Exhausted()) return 0;
  const size_t last = std::size(kBusyStepsMs) - 1;
  const size_t index = attempts < 0 ? 0 : std::min(static_cast<size_t>(attempts), last);
  const int step = std::min<int>(kBusyStepsMs[index], static_cast<int>(std::max<uint32_t>(budget->RemainingMs(), 1)));
  const auto start = std::chrono::steady_clock::now();
  sqlite3_sleep(step);
  const auto waited = std::chrono::duration_cast<std::chrono::milliseconds>(std::chrono::steady_clock::now() - start);
  // A sleep that returned early still costs at least a millisecond, so the
  // budget always runs out.
  budget->Charge(std::max<int64_t>(waited.count(), 1));
  return 1;
}

bool CDbSQLite::Open(const std::u16string& path) {
  Close();
  const std::u16string file = UpToFirstNul(path);
  sqlite3* db = nullptr;
  const int rc = sqlite3_open16(file.c_str(), &db);
  return Adopt(rc, db);
}

bool CDbSQLite::OpenReadOnly(const std::u16string& path) {
  Close();
  // The flags exist only on the UTF-8 entry point.
  const std::string file = Utf16ToUtf8(UpToFirstNul(path));
  sqlite3* db = nullptr;
  const int rc = sqlite3_open_v2(file.c_str(), &db, SQLITE_OPEN_READONLY, nullptr);
  return Adopt(rc, db);
}

bool CDbSQLite::Adopt(int rc, sqlite3* db) {
  if (rc != SQLITE_OK) {
    // SQLite may hand back a connection even when the open failed; it is ours to release.
    if (db != nullptr) sqlite3_close(db);
    return false;
  }
  db_ = db;
  sqlite3_busy_handler(db_, &CDbSQLite::OnBusy, this);
  return true;
}

int64_t CDbSQLite::LastInsertRowId() const { return db_ == nullptr ? 0 : sqlite3_last_insert_rowid(db_); }

bool CDbSQLite::Close() {
  if (db_ == nullptr) return true;
  sqlite3* db = db_;
  db_ = nullptr;
  int rc = sqlite3_close(db);
  while (rc == SQLITE_BUSY) {
    sqlite3_stmt* pending = sqlite3_next_stmt(db, nullptr);
    if (pending == nullptr) break;
    // The statement's object may still be alive; it must not finalize the
    // handle a second time.
    Detach(pending);
    if (sqlite3_finalize(pending) != SQLITE_OK) break;
    rc = sqlite3_close(db);
  }
  if (rc != SQLITE_OK) {
    // Abandoning the connection would keep its file open for the life of the
    // process; let SQLite release it as soon as its last statement goes.
    sqlite3_close_v2(db);
  }
  for (CSqlStatement* statement : live_) statement->owner_ = nullptr;
  live_.clear();
  return true;
}

std::unique_ptr<CSqlStatement> CDbSQLite::Statement(const std::u16string& sql) {
  std::unique_ptr<CSqlStatement> statement(new CSqlStatement(sql, this));
  live_.push_back(statement.get());
  ++prepared_;
  return statement;
}

void CDbSQLite::Forget(CSqlStatement* statement) {
  live_.erase(std::remove(live_.begin(), live_.end(), statement), live_.end());
}

void CDbSQLite::Detach(sqlite3_stmt* handle) {
  for (CSqlStatement* statement : live_) {
    if (statement->stmt_ == handle) statement->stmt_ = nullptr;
  }
}

CSqlStatement::CSqlStatement(const std::u16string& sql, CDbSQLite* owner) : owner_(owner) {
  if (owner->db_ == nullptr) return;
  // The legacy interface, to the text's first zero, without a tail: whatever
  // follows the first statement is ignored.
  last_code_ = sqlite3_prepare16(owner->db_, sql.c_str(), -1, &stmt_, nullptr);
  if (last_code_ != SQLITE_OK) {
    if (stmt_ != nullptr) sqlite3_finalize(stmt_);
    stmt_ = nullptr;
  }
}

CSqlStatement::~CSqlStatement() {
  if (stmt_ != nullptr) sqlite3_finalize(stmt_);
  if (owner_ != nullptr) owner_->Forget(this);
}

bool CSqlStatement::BindText(int index, const std::u16string& value) {
  if (stmt_ == nullptr) return false;
  // SQLite copies the text up to its first zero; no copy of our own first.
  const size_t length = std::min(value.find(u'\0'), value.size());
  const auto bytes = static_cast<int>(std::min<size_t>(length * sizeof(char16_t), 0x7FFFFFF0));
  return sqlite3_bind_text16(stmt_, index, value.data(), bytes, SQLITE_TRANSIENT) == SQLITE_OK;
}

bool CSqlStatement::Execute() {
  if (stmt_ == nullptr) return false;
  const int rc = last_code_ = sqlite3_step(stmt_);
  if (rc == SQLITE_ROW || rc == SQLITE_DONE) {
    sqlite3_reset(stmt_);
    return true;
  }
  return false;
}

bool CSqlStatement::NextRow() {
  if (stmt_ == nullptr) return false;
  const int rc = last_code_ = sqlite3_step(stmt_);
  if (rc == SQLITE_ROW) return true;
  if (rc == SQLITE_DONE) sqlite3_reset(stmt_);
  return false;
}

bool CSqlStatement::FoundNotADatabase() const { return last_code_ == SQLITE_NOTADB; }

std::u16string CSqlStatement::ValueString(int column) {
  value_.clear();
  if (stmt_ != nullptr && column >= 0 && column < sqlite3_data_count(stmt_)) {
    const auto* text = static_cast<const char16_t*>(sqlite3_column_text16(stmt_, column));
    if (text != nullptr) {
      const auto bytes = static_cast<size_t>(sqlite3_column_bytes16(stmt_, column));
      value_ = UpToFirstNul(std::u16string(text, bytes / sizeof(char16_t)));
    }
  }
  return value_;
}

}  // namespace asum
