// The K7720A instrument driver library as the panel calls it.
//
// Every function returns a status: 0 is success, a negative value an error whose text
// ost7720_error_message gives; ost7720_blockAvailable may also return a positive warning.
// Long is int32_t, Integer int16_t. Channel and group ids are Longs: inputs count from 1,
// sources from 4097, tachometers from 8193 across the modules of the session's resource list.
//
// Text buffers are filled with blanks by the caller and hold the stated number of characters.
// The driver writes a NUL-terminated text of at most (size - 1) characters into them and never
// writes past them: interface name 50, discovery error text 250, revision texts 255, error text
// 256 (so an error message is at most 249 characters, to fit the smaller discovery buffer), error
// details as many as the length argument says (the panel passes 100).
#pragma once

#include <cstdint>

#if defined(_WIN32) && !defined(_WIN64)
#define OST7720_CALL __stdcall
#else
#define OST7720_CALL
#endif

#ifdef __cplusplus
extern "C" {
#endif

// clang-format off
// System, sessions and errors
int32_t OST7720_CALL ost7720_find(int32_t reserved, int32_t* addresses, int32_t max_modules, int32_t* found, char* interface_name, int32_t timeout_s);
int32_t OST7720_CALL ost7720_initA(const char* resource, int16_t id_query, int16_t reset, int32_t* session);
int32_t OST7720_CALL ost7720_initB3(const char* resource, int16_t id_query, int16_t reset, int32_t* session);
int32_t OST7720_CALL ost7720_initC(const char* resource, int16_t id_query, int16_t reset, int32_t* session);
int32_t OST7720_CALL ost7720_init(const char* resource_list, int16_t id_query, int16_t reset, int32_t* session);
int32_t OST7720_CALL ost7720_close(int32_t session);
int32_t OST7720_CALL ost7720_getNumChans(int32_t session, int32_t* total, int32_t* inputs, int32_t* sources, int32_t* tachs);
int32_t OST7720_CALL ost7720_getHWConfig(int32_t session, int32_t count, const int32_t* addresses, int32_t* records);
int32_t OST7720_CALL ost7720_revision_query(int32_t session, char* driver_revision, char* firmware_revision);
int32_t OST7720_CALL ost7720_error_message(int32_t session, int32_t status, char* message);
int32_t OST7720_CALL ost7720_errorDetails(int32_t session, char* details, int32_t length);

// Channel groups
int32_t OST7720_CALL ost7720_deleteAllChanGroups(int32_t session);
int32_t OST7720_CALL ost7720_createChannelGroup(int32_t session, int32_t count, const int32_t* channels, int32_t* group);

// Measurement
int32_t OST7720_CALL ost7720_setBlocksize(int32_t session, int32_t channel, int32_t blocksize);
int32_t OST7720_CALL ost7720_getBlocksize(int32_t session, int32_t channel, int32_t* blocksize);
int32_t OST7720_CALL ost7720_setSpan(int32_t session, int32_t channel, double span);
int32_t OST7720_CALL ost7720_getSpan(int32_t session, int32_t channel, double* span);
int32_t OST7720_CALL ost7720_setDataMode(int32_t session, int32_t channel, int32_t mode);
int32_t OST7720_CALL ost7720_setCalcData(int32_t session, int32_t channel, int32_t calc);
int32_t OST7720_CALL ost7720_setEnable(int32_t session, int32_t channel, int32_t kind, int32_t state);
int32_t OST7720_CALL ost7720_getEnable(int32_t session, int32_t channel, int32_t kind, int32_t* state);
int32_t OST7720_CALL ost7720_setAvgMode(int32_t session, int32_t channel, int32_t mode);
int32_t OST7720_CALL ost7720_setAvgNumber(int32_t session, int32_t channel, int32_t number);
int32_t OST7720_CALL ost7720_setAvgUpdate(int32_t session, int32_t channel, int32_t update);
int32_t OST7720_CALL ost7720_setWindow(int32_t session, int32_t channel, int32_t window);
int32_t OST7720_CALL ost7720_setArmMode(int32_t session, int32_t channel, int32_t mode);
int32_t OST7720_CALL ost7720_setAutoTrigger(int32_t session, int32_t channel, int32_t state);
int32_t OST7720_CALL ost7720_initMeasure(int32_t session, int32_t channel);
int32_t OST7720_CALL ost7720_armMeasure(int32_t session, int32_t channel, int32_t reserved);
int32_t OST7720_CALL ost7720_armMeasureMasterSetup(int32_t session, int32_t master);
int32_t OST7720_CALL ost7720_armMeasureSlaveFinish(int32_t session, int32_t slave);
int32_t OST7720_CALL ost7720_armMeasureMasterFinish(int32_t session, int32_t master);
int32_t OST7720_CALL ost7720_triggerMeasure(int32_t session, int32_t channel, int32_t reserved);
int32_t OST7720_CALL ost7720_blockAvailable(int32_t session, int32_t channel, int32_t* available);
int32_t OST7720_CALL ost7720_readFloat64Data(int32_t session, int32_t channel, int32_t data_type, double* data, int32_t count, int32_t* actual, int32_t wait);
int32_t OST7720_CALL ost7720_resetMeasure(int32_t session, int32_t channel);

// Channel settings shared by inputs and sources
int32_t OST7720_CALL ost7720_setActive(int32_t session, int32_t channel, int32_t state);
int32_t OST7720_CALL ost7720_getActive(int32_t session, int32_t channel, int32_t* state);
int32_t OST7720_CALL ost7720_setRange(int32_t session, int32_t channel, double range);
int32_t OST7720_CALL ost7720_getRange(int32_t session, int32_t channel, double* range);
int32_t OST7720_CALL ost7720_setTriggerChannel(int32_t session, int32_t channel, int32_t state);
int32_t OST7720_CALL ost7720_getTriggerChannel(int32_t session, int32_t channel, int32_t* state);
int32_t OST7720_CALL ost7720_preset(int32_t session, int32_t channel);

// Input
int32_t OST7720_CALL ost7720_setCoupling(int32_t session, int32_t channel, int32_t coupling);
int32_t OST7720_CALL ost7720_getCoupling(int32_t session, int32_t channel, int32_t* coupling);
int32_t OST7720_CALL ost7720_setAntiAliasDigital(int32_t session, int32_t channel, int32_t state);
int32_t OST7720_CALL ost7720_getAntiAliasDigital(int32_t session, int32_t channel, int32_t* state);
int32_t OST7720_CALL ost7720_setInputMode(int32_t session, int32_t channel, int32_t mode);
int32_t OST7720_CALL ost7720_getInputMode(int32_t session, int32_t channel, int32_t* mode);
int32_t OST7720_CALL ost7720_setTriggerSlope(int32_t session, int32_t channel, int32_t slope);
int32_t OST7720_CALL ost7720_getTriggerSlope(int32_t session, int32_t channel, int32_t* slope);
int32_t OST7720_CALL ost7720_setTriggerMode(int32_t session, int32_t channel, int32_t mode);
int32_t OST7720_CALL ost7720_getTriggerMode(int32_t session, int32_t channel, int32_t* mode);
int32_t OST7720_CALL ost7720_setTriggerLevel(int32_t session, int32_t channel, int32_t which, double level);
int32_t OST7720_CALL ost7720_getTriggerLevel(int32_t session, int32_t channel, int32_t which, double* level);

// Source
int32_t OST7720_CALL ost7720_setSourceMode(int32_t session, int32_t channel, int32_t mode);
int32_t OST7720_CALL ost7720_getSourceMode(int32_t session, int32_t channel, int32_t* mode);
int32_t OST7720_CALL ost7720_setSourceOutput(int32_t session, int32_t channel, int32_t output);
int32_t OST7720_CALL ost7720_getSourceOutput(int32_t session, int32_t channel, int32_t* output);
int32_t OST7720_CALL ost7720_setSourceSum(int32_t session, int32_t channel, int32_t state);
int32_t OST7720_CALL ost7720_getSourceSum(int32_t session, int32_t channel, int32_t* state);
int32_t OST7720_CALL ost7720_setSourceCola(int32_t session, int32_t channel, int32_t state);
int32_t OST7720_CALL ost7720_getSourceCola(int32_t session, int32_t channel, int32_t* state);
int32_t OST7720_CALL ost7720_setRampRate(int32_t session, int32_t channel, double seconds);
int32_t OST7720_CALL ost7720_getRampRate(int32_t session, int32_t channel, double* seconds);
int32_t OST7720_CALL ost7720_setSineFreq(int32_t session, int32_t channel, double hertz);
int32_t OST7720_CALL ost7720_getSineFreq(int32_t session, int32_t channel, double* hertz);
int32_t OST7720_CALL ost7720_setSinePhase(int32_t session, int32_t channel, double degrees);
int32_t OST7720_CALL ost7720_getSinePhase(int32_t session, int32_t channel, double* degrees);
int32_t OST7720_CALL ost7720_setSourceSeed(int32_t session, int32_t channel, int32_t seed);
int32_t OST7720_CALL ost7720_getSourceSeed(int32_t session, int32_t channel, int32_t* seed);
int32_t OST7720_CALL ost7720_setDutyCycle(int32_t session, int32_t channel, double fraction);
int32_t OST7720_CALL ost7720_getDutyCycle(int32_t session, int32_t channel, double* fraction);

// Arbitrary waveform buffer of a source
int32_t OST7720_CALL ost7720_setAmpScale(int32_t session, int32_t channel, double scale);
int32_t OST7720_CALL ost7720_setSourceBlocksize(int32_t session, int32_t channel, int32_t blocksize);
int32_t OST7720_CALL ost7720_setSrcBufferSize(int32_t session, int32_t channel, int32_t size);
int32_t OST7720_CALL ost7720_setSrcBufferMode(int32_t session, int32_t channel, int32_t mode);
int32_t OST7720_CALL ost7720_setSrcBufferInit(int32_t session, int32_t channel, int32_t init);
int32_t OST7720_CALL ost7720_checkSrcArbRdy(int32_t session, int32_t channel, int32_t mode, int32_t* ready);
int32_t OST7720_CALL ost7720_writeSrcBufferData(int32_t session, int32_t channel, const int32_t* data, int32_t count, int32_t mode);

// clang-format on

#ifdef __cplusplus
}
#endif
