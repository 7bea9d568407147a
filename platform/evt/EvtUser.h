// Event-observation library: posts host events that monitoring picks up.
#pragma once

extern "C" {
int EvtUserLib_Init(void);
// `format` carries the event identifier between "@&!*@*@(" and ")", then a printf format.
int EvtUserLib_AddEvt(const char* format, ...) __attribute__((format(printf, 1, 2)));
void EvtUserLib_Close(void);
}
