#include "launcher-data-manager/store-test.h"

namespace {

int RecordStatement(unsigned, void* context, void* stmt, void*) {
  const char* sql = sqlite3_sql(static_cast<sqlite3_stmt*>(stmt));
  static_cast<std::vector<std::string>*>(context)->push_back(sql ? sql : "");
  return 0;
}

}  // namespace

StoreTest::StoreTest() {
  store._OpenDb();
  db.reset(new SqlProbe(DbPath()));
  sqlite3_trace_v2(store.m_db, SQLITE_TRACE_STMT, RecordStatement, &statements);
  device.ClearLogs();
}

int StoreTest::AddMenu(const std::string& name) {
  db->Exec("INSERT INTO Menus(name, type) VALUES('" + name + "', 0)");
  return static_cast<int>(sqlite3_last_insert_rowid(db->db()));
}

int StoreTest::AddPage(int parentId, int pageNo, bool isFolder) {
  db->Exec("INSERT INTO Pages(isFolder, parentId, pageNo) VALUES(" +
           std::to_string(isFolder) + ", " + std::to_string(parentId) + ", " +
           std::to_string(pageNo) + ")");
  return static_cast<int>(sqlite3_last_insert_rowid(db->db()));
}

int StoreTest::AddBox(int pageId, const std::string& appId, int col, int row) {
  return AddBoxSql("isFolder, pageId, appId, col, row, isPreload, isSystem, boxType, launchType",
                   "0, " + std::to_string(pageId) + ", '" + appId + "', " + std::to_string(col) +
                       ", " + std::to_string(row) + ", 0, 0, 0, 0");
}

int StoreTest::AddBoxSql(const std::string& columns, const std::string& values) {
  db->Exec("INSERT INTO Boxes(" + columns + ") VALUES(" + values + ")");
  return static_cast<int>(sqlite3_last_insert_rowid(db->db()));
}

void StoreTest::FillPage(int pageId, int count, const std::string& prefix) {
  db->Exec("INSERT INTO Boxes(isFolder, pageId, appId, col, row, isPreload, isSystem, boxType, "
           "launchType) WITH RECURSIVE n(i) AS (SELECT 0 UNION ALL SELECT i + 1 FROM n WHERE i < " +
           std::to_string(count - 1) + ") SELECT 0, " + std::to_string(pageId) + ", '" + prefix +
           "' || i, i % 4 + 1, i / 4 + 1, 0, 0, 0, 0 FROM n");
}

std::string StoreTest::CellOf(const std::string& appId) {
  return db->Value("SELECT col || ',' || row FROM Boxes WHERE appId = '" + appId + "'");
}

std::string StoreTest::Counts() {
  return db->Value("SELECT (SELECT count(*) FROM Menus) || ' ' || (SELECT count(*) FROM Pages) || "
                   "' ' || (SELECT count(*) FROM Boxes)");
}

void StoreTest::Break(const std::string& table) {
  db->Exec("ALTER TABLE " + table + " RENAME TO " + table + "Gone");
  // The store's connection notices the change at its next read of the schema;
  // make that happen now, so that the very next statement already fails to compile.
  sqlite3_exec(store.m_db, "SELECT count(*) FROM sqlite_master", NULL, NULL, NULL);
  TakeStatements();
}

std::vector<std::string> StoreTest::TakeStatements() {
  std::vector<std::string> taken;
  taken.swap(statements);
  return taken;
}

std::vector<std::pair<int, int> > StoreTest::Cells(
    const std::vector<boost::shared_ptr<GameBoxData> >& boxes) {
  std::vector<std::pair<int, int> > cells;
  for (size_t i = 0; i < boxes.size(); ++i)
    cells.push_back(std::make_pair(boxes[i]->col, boxes[i]->row));
  return cells;
}

Row StoreTest::Fields(const GameBoxData& b) {
  const int numbers[] = {b.boxId, b.isFolder, b.pageId, b.parentId, b.col, b.row};
  Row row;
  for (int n : numbers) row.push_back(std::to_string(n));
  row.insert(row.end(), {b.appId, b.name, std::to_string(b.isPreload), std::to_string(b.isSystem),
                         std::to_string(b.boxType), std::to_string(b.launchType), b.iconPath,
                         b.content});
  return row;
}

Row StoreTest::Fields(const GamePageData& p) {
  return {std::to_string(p.pageId), std::to_string(p.isFolder), std::to_string(p.parentId),
          std::to_string(p.pageNo)};
}

Row StoreTest::Fields(const GameViewData& m) {
  return {std::to_string(m.menuId), m.name, std::to_string(m.type)};
}
