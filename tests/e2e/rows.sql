SELECT "Alert Action", "Alert Type", "Alert Name", "When", "Threshold", "Who", "Operation",
       "Component Name", "EmailStatus", "Server Name",
       substr(replace("Alert Path", '\', '/'), instr(replace("Alert Path", '\', '/'), '/install/') + 9) AS path
FROM AlertDB WHERE "Alert Path" NOT LIKE '%Deep%' ORDER BY path;
