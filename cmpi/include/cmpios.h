/* The handles that the broker's operating system table (CMPIBrokerExtFT) deals in: opaque to the provider. */
#ifndef NORVANE_CMPIOS_H
#define NORVANE_CMPIOS_H

#define CMPI_THREAD_TYPE void*
#define CMPI_THREAD_RETURN void*
#define CMPI_THREAD_CDECL
#define CMPI_THREAD_KEY_TYPE unsigned long int
#define CMPI_MUTEX_TYPE void*
#define CMPI_COND_TYPE void*

#endif
