# The safe save and what it stands on.
zulm_add_test(Platform/DurableFileTest)
zulm_add_test(ZULMetaData/RepairPlanTest)
zulm_add_test(ZULMetaData/StreamExtentTest)
zulm_add_test(ZULMetaDataBridge/SafeMovieSaveTest)
zulm_add_test(ZULMetaDataBridge/CrashedRecordingTest)
